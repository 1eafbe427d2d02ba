(: How many products no line sells. :)
declare namespace p = "urn:example:products";
declare namespace o = "urn:example:orders";
count(for $product in //p:product where empty(//o:line[@sku = $product/@sku]) return $product)
