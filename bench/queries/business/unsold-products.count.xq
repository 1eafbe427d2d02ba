(: How many products no line sells. :)
declare namespace p = "urn:example:products";
declare namespace o = "urn:example:orders";
count(for $product in //p:product
      where count(//o:line[@sku = $product/@sku]) = 0
      return $product)
