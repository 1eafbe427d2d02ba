(: How many products cost more than each of a hundred limits. :)
declare namespace p = "urn:example:products";
let $prices := //p:price
for $i in 1 to 100
let $limit := 5 * $i
return count($prices[$limit < .])
