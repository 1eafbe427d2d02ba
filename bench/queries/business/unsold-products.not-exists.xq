(: How many products no line sells. :)
declare namespace p = "urn:example:products";
declare namespace o = "urn:example:orders";
count(for $product in //p:product
      where not(exists(for $line in //o:line where $line/@sku = $product/@sku return $line))
      return $product)
