(: What every person bought, as a number. :)
for $person in /site/people/person
let $bought := /site/closed_auctions/closed_auction
               [some $buyer in buyer satisfies $buyer/@person = $person/@id]
return <item person="{$person/name/text()}">{count($bought)}</item>
