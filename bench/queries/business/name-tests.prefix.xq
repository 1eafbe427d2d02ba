(: How many elements are orders. :)
declare namespace o = "urn:example:orders";
count(//o:order)
