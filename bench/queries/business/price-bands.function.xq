(: How many products cost more than each of a hundred limits. :)
declare namespace p = "urn:example:products";
declare function local:above($products, $limit) { $products[p:price > $limit] };
let $products := //p:product
for $i in 1 to 100 return count(local:above($products, 5 * $i))
