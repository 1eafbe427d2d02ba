(: What every person bought, as a number. :)
let $buyers := for $sale in /site/closed_auctions/closed_auction return string($sale/buyer/@person)
for $person in /site/people/person
return <item person="{$person/name/text()}">{count($buyers[. = $person/@id])}</item>
