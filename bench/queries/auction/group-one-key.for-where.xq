(: How many items there are at each location. :)
for $location in distinct-values(/site/regions/*/item/location)
return <at place="{$location}">{
  count(for $item in /site/regions/*/item where $item/location = $location return $item)
}</at>
