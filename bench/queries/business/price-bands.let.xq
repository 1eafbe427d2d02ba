(: How many products cost more than each of a hundred limits. :)
declare namespace b = "urn:example:business";
declare namespace p = "urn:example:products";
let $prices := for $price in /b:business/p:products/p:product/p:price return number($price)
for $limit in (for $i in 1 to 100 return 5 * $i)
return count($prices[. > $limit])
