(: How many orders the customers of one country have each. :)
declare namespace b = "urn:example:business";
declare namespace c = "urn:example:customers";
declare namespace o = "urn:example:orders";
declare function local:of($orders, $customer) { $orders[@customer = $customer/@id] };
let $orders := /b:business/o:orders/o:order
for $customer in /b:business/c:customers/c:customer[@country = "KE"]
return <orders of="{$customer/c:name}">{count(local:of($orders, $customer))}</orders>
