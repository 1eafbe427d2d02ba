(: How many orders the customers of one country have each. :)
for $customer in //*:customer[@country = "KE"]
return <orders of="{$customer/*:name}">{count(//*:order[@customer = $customer/@id])}</orders>
