(: How many orders there are in each month. :)
declare namespace o = "urn:example:orders";
for $month in distinct-values(for $order in //o:order return substring($order/@date, 1, 7))
order by $month
return <month of="{$month}">{count(//o:order[substring(@date, 1, 7) = $month])}</month>
