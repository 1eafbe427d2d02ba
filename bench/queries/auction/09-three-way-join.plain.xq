(: The European items that every person bought, by name. :)
let $european := /site/regions/europe/item
for $person in /site/people/person
let $names := for $sale in /site/closed_auctions/closed_auction[buyer/@person = $person/@id]
              return $european[@id = $sale/itemref/@item]/name/text()
return <person name="{$person/name/text()}">{
  for $name in $names return <item>{$name}</item>
}</person>
