(: How many products no line sells. :)
declare namespace b = "urn:example:business";
declare namespace p = "urn:example:products";
declare namespace o = "urn:example:orders";
let $sold := /b:business/o:orders/o:order/o:line/@sku
return count(/b:business/p:products/p:product[not(@sku = $sold)])
