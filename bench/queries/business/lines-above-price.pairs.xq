(: Lines sold above the price of their product. :)
declare namespace p = "urn:example:products";
declare namespace o = "urn:example:orders";
count(for $line in //o:line, $product in //p:product
      where $line/@sku = $product/@sku and number($line/@price) > number($product/p:price)
      return $line)
