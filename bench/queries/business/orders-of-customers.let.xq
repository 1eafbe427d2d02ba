(: How many orders the customers of one country have each. :)
declare namespace c = "urn:example:customers";
declare namespace o = "urn:example:orders";
let $orders := //o:order
for $customer in //c:customer[@country = "KE"]
let $id := string($customer/@id)
return <orders of="{$customer/c:name}">{count($orders[@customer eq $id])}</orders>
