(: Lines of orders of gold customers with a product of one group. :)
declare namespace c = "urn:example:customers";
declare namespace p = "urn:example:products";
declare namespace o = "urn:example:orders";
count(for $customer in //c:customer, $order in //o:order, $line in $order/o:line,
          $product in //p:product
      where $customer/@class = "gold" and $order/@customer = $customer/@id
        and $product/@sku = $line/@sku and $product/@group = "g7"
      return $line)
