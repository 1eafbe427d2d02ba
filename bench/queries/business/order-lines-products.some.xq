(: Lines of orders of gold customers with a product of one group. :)
declare namespace c = "urn:example:customers";
declare namespace p = "urn:example:products";
declare namespace o = "urn:example:orders";
count(for $line in //o:line
      where (some $product in //p:product
             satisfies ($product/@sku = $line/@sku and $product/@group = "g7"))
        and (some $customer in //c:customer
             satisfies ($customer/@id = $line/../@customer and $customer/@class = "gold"))
      return $line)
