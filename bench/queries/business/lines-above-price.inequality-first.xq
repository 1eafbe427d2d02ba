(: Lines sold above the price of their product. :)
declare namespace p = "urn:example:products";
declare namespace o = "urn:example:orders";
count(for $line in //o:line, $product in //p:product
      where number($line/@price) > number($product/p:price) and $line/@sku = $product/@sku
      return $line)
