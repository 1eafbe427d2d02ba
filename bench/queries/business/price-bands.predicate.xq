(: How many products cost more than each of a hundred limits. :)
declare namespace p = "urn:example:products";
for $i in 1 to 100
return count(//p:product[p:price > 5 * $i])
