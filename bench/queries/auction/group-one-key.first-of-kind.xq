(: How many items there are at each location. :)
let $items := /site/regions/*/item
for $item at $i in $items
where not($item/location = $items[position() < $i]/location)
return <at place="{$item/location}">{count($items[location = $item/location])}</at>
