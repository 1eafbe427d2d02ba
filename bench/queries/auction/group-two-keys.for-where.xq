(: How many items there are at each location for each way to pay. :)
for $location in distinct-values(/site/regions/*/item/location),
    $payment in distinct-values(/site/regions/*/item/payment)
let $members := for $item in /site/regions/*/item
                where $item/payment = $payment and $item/location = $location
                return $item
return <at place="{$location}" by="{$payment}">{count($members)}</at>
