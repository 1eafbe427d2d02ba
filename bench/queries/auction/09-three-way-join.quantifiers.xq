(: The European items that every person bought, by name. :)
for $person in /site/people/person
return <person name="{$person/name/text()}">{
  for $sale in /site/closed_auctions/closed_auction
  where some $buyer in $sale/buyer satisfies $buyer/@person = $person/@id
  return
    for $item in /site/regions/europe/item
    where some $reference in $sale/itemref satisfies $reference/@item = $item/@id
    return <item>{$item/name/text()}</item>
}</person>
