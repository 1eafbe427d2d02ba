(: How many items there are at each location. :)
for $location in distinct-values(//item/location)
return <at place="{$location}">{
  count(//item[some $own in location satisfies string($own) eq $location])
}</at>
