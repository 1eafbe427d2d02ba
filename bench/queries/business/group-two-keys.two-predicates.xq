(: The orders of each year and status. :)
declare namespace b = "urn:example:business";
declare namespace o = "urn:example:orders";
let $orders := /b:business/o:orders/o:order
for $year in distinct-values(for $order in $orders return substring($order/@date, 1, 4)),
    $status in distinct-values($orders/@status)
return <orders in="{$year}" are="{$status}">{
  count($orders[@status = $status][starts-with(@date, $year)])
}</orders>
