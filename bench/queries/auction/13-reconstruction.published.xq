(: The items of one region with their descriptions as they stand. :)
let $auction := (/)
return
  for $i in $auction/site/regions/australia/item
  return <item name="{$i/name/text()}">{$i/description}</item>
