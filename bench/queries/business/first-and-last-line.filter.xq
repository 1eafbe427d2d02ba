(: Orders whose last line has a higher price than the first. :)
declare namespace o = "urn:example:orders";
count(//o:order[o:line[last()]/@price > number(o:line[1]/@price)])
