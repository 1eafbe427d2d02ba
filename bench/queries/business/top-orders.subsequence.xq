(: The ten largest orders. :)
declare namespace b = "urn:example:business";
declare namespace o = "urn:example:orders";
subsequence(for $order in /b:business/o:orders/o:order
            let $total := sum(for $line in $order/o:line
                              return number($line/@price) * number($line/@quantity))
            order by $total descending
            return <order of="{$order/@customer}">{round($total)}</order>, 1, 10)
