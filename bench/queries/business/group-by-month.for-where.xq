(: How many orders there are in each month. :)
declare namespace o = "urn:example:orders";
for $month in distinct-values(for $order in //o:order return substring($order/@date, 1, 7))
let $members := for $order in //o:order
                where substring($order/@date, 1, 7) = $month
                return $order
order by $month
return <month of="{$month}">{count($members)}</month>
