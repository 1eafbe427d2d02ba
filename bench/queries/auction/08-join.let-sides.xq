(: What every person bought, as a number. :)
let $sales := /site/closed_auctions/closed_auction
for $person in /site/people/person
let $id := $person/@id
let $bought := $sales[buyer/@person = $id]
return <item person="{$person/name/text()}">{count($bought)}</item>
