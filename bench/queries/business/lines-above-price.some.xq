(: Lines sold above the price of their product. :)
declare namespace p = "urn:example:products";
declare namespace o = "urn:example:orders";
count(for $line in //o:line
      where some $product in //p:product
            satisfies ($product/@sku = $line/@sku and $product/p:price < number($line/@price))
      return $line)
