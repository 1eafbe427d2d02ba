(: What every person bought, as a number. :)
for $person in /site/people/person
let $bought := //closed_auction/buyer[@person = $person/@id]/..
return <item person="{$person/name/text()}">{count($bought)}</item>
