(: Open orders of more than five lines. :)
declare namespace o = "urn:example:orders";
count(//o:order[@status = "open"] except //o:order[count(o:line) <= 5])
