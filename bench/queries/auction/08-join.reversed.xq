(: What every person bought, as a number. :)
for $person in /site/people/person
let $bought := for $sale in /site/closed_auctions/closed_auction
               where $person/@id = $sale/buyer/@person
               return $sale
return <item person="{$person/name/text()}">{count($bought)}</item>
