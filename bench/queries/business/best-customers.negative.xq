(: The ten customers with most lines. :)
declare namespace c = "urn:example:customers";
declare namespace o = "urn:example:orders";
let $orders := //o:order
let $counts := for $customer in //c:customer
               let $count := count($orders[@customer = $customer/@id]/o:line)
               order by 0 - $count
               return $count
for $count in $counts[position() < 11]
return <lines>{$count}</lines>
