(: Orders whose last line has a higher price than the first. :)
declare namespace o = "urn:example:orders";
count(//o:order[o:line[number(@number) = count(../o:line)]/@price
                > number(o:line[@number = 1]/@price)])
