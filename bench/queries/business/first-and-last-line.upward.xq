(: Orders whose last line has a higher price than the first. :)
declare namespace o = "urn:example:orders";
count(//o:line[empty(following-sibling::o:line)][@price > number(../o:line[1]/@price)])
