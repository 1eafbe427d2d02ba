(: How many orders are of the year 2003. :)
declare namespace b = "urn:example:business";
declare namespace o = "urn:example:orders";
count(/b:business/o:orders/o:order[starts-with(@date, "2003-")])
