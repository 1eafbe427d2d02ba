(: Orders whose last line has a higher price than the first. :)
declare namespace o = "urn:example:orders";
count(//o:order[number(o:line[position() = last()]/@price)
                > number(o:line[position() = 1]/@price)])
