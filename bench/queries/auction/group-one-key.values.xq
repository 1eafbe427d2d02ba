(: How many items there are at each location. :)
let $locations := //item/location
for $location in distinct-values($locations)
return <at place="{$location}">{count($locations[. = $location])}</at>
