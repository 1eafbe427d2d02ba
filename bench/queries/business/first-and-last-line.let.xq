(: Orders whose last line has a higher price than the first. :)
declare namespace o = "urn:example:orders";
count(for $order in //o:order
      let $first := $order/o:line[1], $last := $order/o:line[last()]
      where number($last/@price) > number($first/@price)
      return $order)
