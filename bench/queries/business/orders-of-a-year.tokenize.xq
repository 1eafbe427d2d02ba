(: How many orders are of the year 2003. :)
declare namespace o = "urn:example:orders";
count(//o:order[tokenize(@date, "-")[1] = "2003"])
