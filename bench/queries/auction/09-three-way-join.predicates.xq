(: The European items that every person bought, by name. :)
for $person in /site/people/person
return <person name="{$person/name/text()}">{
  for $sale in /site/closed_auctions/closed_auction[buyer/@person = $person/@id],
      $item in /site/regions/europe/item[@id = $sale/itemref/@item]
  return <item>{$item/name/text()}</item>
}</person>
