(: The ten largest orders. :)
declare namespace o = "urn:example:orders";
for $order at $i in (for $order in //o:order
                     let $total := sum(for $line in $order/o:line
                                       return $line/@price * $line/@quantity)
                     order by $total descending
                     return <order of="{$order/@customer}">{round($total)}</order>)
where $i <= 10
return $order
