(: How many products cost more than each of a hundred limits. :)
declare namespace p = "urn:example:products";
for $i in 1 to 100
return sum(for $product in //p:product return if ($product/p:price > 5 * $i) then 1 else 0)
