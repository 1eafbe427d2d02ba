(: Lines of orders of gold customers with a product of one group. :)
declare namespace c = "urn:example:customers";
declare namespace p = "urn:example:products";
declare namespace o = "urn:example:orders";
count(for $customer in //c:customer[@class = "gold"],
          $order in //o:order[@customer = $customer/@id], $line in $order/o:line,
          $product in //p:product[@group = "g7"][@sku = $line/@sku]
      return $line)
