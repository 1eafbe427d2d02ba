(: How many items there are at each location. :)
for $location in distinct-values(/site/regions/*/item/location)
return <at place="{$location}">{count(/site/regions/*/item[location = $location])}</at>
