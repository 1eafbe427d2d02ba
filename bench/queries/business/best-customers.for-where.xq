(: The ten customers with most lines. :)
declare namespace c = "urn:example:customers";
declare namespace o = "urn:example:orders";
(for $customer in //c:customer
 let $lines := for $order in //o:order
               where $order/@customer = $customer/@id
               return $order/o:line
 order by count($lines) descending
 return <lines>{count($lines)}</lines>)[position() <= 10]
