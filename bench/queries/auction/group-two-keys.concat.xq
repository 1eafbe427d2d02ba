(: How many items there are at each location for each way to pay. :)
let $items := /site/regions/*/item
let $keys := for $item in $items return concat($item/location, "|", $item/payment)
for $location in distinct-values($items/location), $payment in distinct-values($items/payment)
return <at place="{$location}" by="{$payment}">{
  count($keys[. = concat($location, "|", $payment)])
}</at>
