(: How many items there are at each location for each way to pay. :)
let $items := /site/regions/*/item
for $location in distinct-values($items/location), $payment in distinct-values($items/payment)
return <at place="{$location}" by="{$payment}">{
  count($items[location = $location][payment = $payment])
}</at>
