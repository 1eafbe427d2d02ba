(: How many orders there are in each month. :)
declare namespace b = "urn:example:business";
declare namespace o = "urn:example:orders";
declare function local:month($order) { substring($order/@date, 1, 7) };
let $orders := /b:business/o:orders/o:order
for $month in distinct-values(for $order in $orders return local:month($order))
order by $month
return <month of="{$month}">{count($orders[local:month(.) = $month])}</month>
