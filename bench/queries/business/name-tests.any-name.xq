(: How many elements are orders. :)
declare namespace b = "urn:example:business";
declare namespace o = "urn:example:orders";
count(/b:business/o:orders/o:*)
