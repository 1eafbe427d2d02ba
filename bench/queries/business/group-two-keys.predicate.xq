(: The orders of each year and status. :)
declare namespace o = "urn:example:orders";
for $year in distinct-values(for $order in //o:order return substring($order/@date, 1, 4)),
    $status in distinct-values(//o:order/@status)
return <orders in="{$year}" are="{$status}">{
  count(//o:order[@status = $status and substring(@date, 1, 4) = $year])
}</orders>
