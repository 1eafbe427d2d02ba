(: The orders of each year and status. :)
declare namespace o = "urn:example:orders";
let $orders := //o:order
let $keys := for $order in $orders return concat(substring($order/@date, 1, 4), $order/@status)
for $year in distinct-values(for $order in $orders return substring($order/@date, 1, 4)),
    $status in distinct-values($orders/@status)
return <orders in="{$year}" are="{$status}">{count($keys[. = concat($year, $status)])}</orders>
