(: How many orders the customers of one country have each. :)
declare namespace c = "urn:example:customers";
declare namespace o = "urn:example:orders";
for $customer in //c:customer
where $customer/@country eq "KE"
return <orders of="{$customer/c:name}">{
  count(for $order in //o:order
        where some $key in $order/@customer satisfies $key = $customer/@id
        return $order)
}</orders>
