(: Lines of orders of gold customers with a product of one group. :)
declare namespace c = "urn:example:customers";
declare namespace p = "urn:example:products";
declare namespace o = "urn:example:orders";
let $gold := //c:customer[@class = "gold"]/@id
let $group := //p:product[@group = "g7"]/@sku
return count(//o:order[@customer = $gold]/o:line[@sku = $group])
