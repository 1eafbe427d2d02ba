(: The ten customers with most lines. :)
declare namespace c = "urn:example:customers";
declare namespace o = "urn:example:orders";
for $count at $i in (for $customer in //c:customer
                     let $count := count(//o:line[../@customer = $customer/@id])
                     order by $count descending
                     return $count)
where $i <= 10
return <lines>{$count}</lines>
