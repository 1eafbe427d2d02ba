(: How many orders the customers of one country have each. :)
declare namespace b = "urn:example:business";
declare namespace c = "urn:example:customers";
declare namespace o = "urn:example:orders";
for $customer in /b:business/c:customers/c:customer
let $orders := for $order in /b:business/o:orders/o:order
               where $order/@customer = $customer/@id
               return $order
where $customer/@country = "KE"
return <orders of="{$customer/c:name}">{count($orders)}</orders>
