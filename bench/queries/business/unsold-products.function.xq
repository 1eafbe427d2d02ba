(: How many products no line sells. :)
declare namespace p = "urn:example:products";
declare namespace o = "urn:example:orders";
declare function local:sold($lines, $sku) { $lines[@sku = $sku] };
let $lines := //o:line
return count(//p:product[empty(local:sold($lines, @sku))])
