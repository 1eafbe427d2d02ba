(: How many items there are at each location for each way to pay. :)
let $items := /site/regions/*/item
let $payments := distinct-values($items/payment)
for $location in distinct-values($items/location)
let $there := $items[location = $location]
for $payment in $payments
return <at place="{$location}" by="{$payment}">{count($there[payment = $payment])}</at>
