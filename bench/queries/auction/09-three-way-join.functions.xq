(: The European items that every person bought, by name. :)
declare function local:sales($all, $person) { $all[buyer/@person = $person/@id] };
declare function local:items($all, $sale) { $all[@id = $sale/itemref/@item] };
let $sales := /site/closed_auctions/closed_auction, $items := /site/regions/europe/item
for $person in /site/people/person
return <person name="{$person/name/text()}">{
  for $sale in local:sales($sales, $person), $item in local:items($items, $sale)
  return <item>{$item/name/text()}</item>
}</person>
