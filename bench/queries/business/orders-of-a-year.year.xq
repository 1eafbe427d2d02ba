(: How many orders are of the year 2003. :)
declare namespace o = "urn:example:orders";
count(//o:order[year-from-date(@date) = 2003])
