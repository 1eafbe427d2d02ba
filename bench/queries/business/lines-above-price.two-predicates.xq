(: Lines sold above the price of their product. :)
declare namespace p = "urn:example:products";
declare namespace o = "urn:example:orders";
count(for $product in //p:product
      return //o:line[@sku = $product/@sku][@price > number($product/p:price)])
