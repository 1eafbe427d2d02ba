(: Lines sold above the price of their product. :)
declare namespace p = "urn:example:products";
declare namespace o = "urn:example:orders";
declare function local:price($products, $sku) { number($products[@sku = $sku]/p:price) };
let $products := //p:product
return count(//o:line[number(@price) > local:price($products, @sku)])
