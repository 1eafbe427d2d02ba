(: How many items there are at each location for each way to pay. :)
for $location in distinct-values(/site/regions/*/item/location),
    $payment in distinct-values(/site/regions/*/item/payment)
return <at place="{$location}" by="{$payment}">{
  count(/site/regions/*/item[location = $location and payment = $payment])
}</at>
