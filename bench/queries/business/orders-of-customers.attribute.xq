(: How many orders the customers of one country have each. :)
declare namespace c = "urn:example:customers";
declare namespace o = "urn:example:orders";
for $customer in //c:customer[@country = "KE"]
return <orders of="{$customer/c:name}">{count(//o:order/@customer[. = $customer/@id])}</orders>
