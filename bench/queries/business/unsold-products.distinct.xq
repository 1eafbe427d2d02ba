(: How many products no line sells. :)
declare namespace p = "urn:example:products";
declare namespace o = "urn:example:orders";
count(//p:product) - count(distinct-values(//o:line/@sku))
