(: Orders whose last line has a higher price than the first. :)
declare namespace o = "urn:example:orders";
count(for $order in //o:order
      let $lines := $order/o:line
      where number(subsequence($lines, count($lines), 1)/@price)
          > number(subsequence($lines, 1, 1)/@price)
      return $order)
