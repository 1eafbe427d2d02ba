(: Lines of orders of gold customers with a product of one group. :)
declare namespace c = "urn:example:customers";
declare namespace p = "urn:example:products";
declare namespace o = "urn:example:orders";
count(for $order in //o:order, $line in $order/o:line
      where //c:customer[@id = $order/@customer]/@class = "gold"
        and //p:product[@sku = $line/@sku]/@group = "g7"
      return $line)
