(: How many products no line sells. :)
declare namespace p = "urn:example:products";
declare namespace o = "urn:example:orders";
count(//p:product except //p:product[@sku = //o:line/@sku])
