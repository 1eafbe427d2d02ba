(: Lines of orders of gold customers with a product of one group. :)
declare namespace c = "urn:example:customers";
declare namespace p = "urn:example:products";
declare namespace o = "urn:example:orders";
declare function local:customer($all, $order) { $all[@id = $order/@customer] };
declare function local:product($all, $line) { $all[@sku = $line/@sku] };
let $customers := //c:customer, $products := //p:product
return count(for $order in //o:order
             where local:customer($customers, $order)/@class = "gold"
             return for $line in $order/o:line
                    where local:product($products, $line)/@group = "g7"
                    return $line)
