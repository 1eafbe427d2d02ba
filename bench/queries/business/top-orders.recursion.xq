(: The ten largest orders. :)
declare namespace o = "urn:example:orders";
declare function local:total($lines) {
  if (empty($lines)) then 0
  else $lines[1]/@price * $lines[1]/@quantity + local:total(subsequence($lines, 2))
};
subsequence(for $order in //o:order
            let $total := local:total($order/o:line)
            order by $total descending
            return <order of="{$order/@customer}">{round($total)}</order>, 1, 10)
