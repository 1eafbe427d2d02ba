(: The orders of each year and status. :)
declare namespace o = "urn:example:orders";
let $orders := //o:order
let $states := distinct-values($orders/@status)
for $year in distinct-values(for $order in $orders return substring($order/@date, 1, 4))
let $own := $orders[starts-with(@date, $year)]
for $status in $states
return <orders in="{$year}" are="{$status}">{count($own[@status = $status])}</orders>
