(: Open orders of more than five lines. :)
declare namespace o = "urn:example:orders";
count(//o:order[@status = "open" and count(o:line) > 5])
