(: How many orders there are in each month. :)
declare namespace o = "urn:example:orders";
let $months := for $order in //o:order return substring($order/@date, 1, 7)
for $month in distinct-values($months)
order by $month
return <month of="{$month}">{count($months[. = $month])}</month>
