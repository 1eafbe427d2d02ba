(: Lines sold above the price of their product. :)
declare namespace b = "urn:example:business";
declare namespace p = "urn:example:products";
declare namespace o = "urn:example:orders";
let $products := /b:business/p:products/p:product
return count(for $line in /b:business/o:orders/o:order/o:line
             let $product := $products[@sku = $line/@sku]
             where xs:decimal($line/@price) > xs:decimal($product/p:price)
             return $line)
