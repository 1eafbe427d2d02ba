(: The ten largest orders. :)
declare namespace o = "urn:example:orders";
declare function local:total($order) {
  sum(for $line in $order/o:line return $line/@price * $line/@quantity)
};
(for $order in //o:order
 order by local:total($order) descending
 return <order of="{$order/@customer}">{round(local:total($order))}</order>)[position() <= 10]
