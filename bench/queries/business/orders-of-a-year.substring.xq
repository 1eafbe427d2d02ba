(: How many orders are of the year 2003. :)
declare namespace o = "urn:example:orders";
count(//o:order[substring(@date, 1, 4) = "2003"])
