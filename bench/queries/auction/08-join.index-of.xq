(: What every person bought, as a number. :)
let $buyers := data(/site/closed_auctions/closed_auction/buyer/@person)
for $person in /site/people/person
return <item person="{$person/name/text()}">{count(index-of($buyers, string($person/@id)))}</item>
