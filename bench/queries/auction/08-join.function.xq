(: What every person bought, as a number. :)
declare function local:bought($sales, $id) { $sales[buyer/@person = $id] };
let $sales := /site/closed_auctions/closed_auction
for $person in /site/people/person
return <item person="{$person/name/text()}">{count(local:bought($sales, $person/@id))}</item>
