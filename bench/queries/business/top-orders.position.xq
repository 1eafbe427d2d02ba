(: The ten largest orders. :)
declare namespace o = "urn:example:orders";
(for $order in //o:order
 let $total := sum(for $line in $order/o:line return xs:decimal($line/@price) * $line/@quantity)
 order by $total descending
 return <order of="{$order/@customer}">{round($total)}</order>)[position() <= 10]
