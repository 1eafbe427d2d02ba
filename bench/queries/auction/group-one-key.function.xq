(: How many items there are at each location. :)
declare function local:at($items, $location) { count($items[location eq $location]) };
let $items := /site/regions/*/item
for $location in distinct-values($items/location)
return <at place="{$location}">{local:at($items, $location)}</at>
