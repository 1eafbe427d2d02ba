(: How many items there are at each location. :)
let $items := /site/regions/*/item
for $location in distinct-values($items/location)
let $members := $items[location = $location]
return <at place="{$location}">{count($members)}</at>
