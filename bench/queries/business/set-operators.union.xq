(: Open orders of more than five lines. :)
declare namespace o = "urn:example:orders";
count(//o:order[@status = "open"]) + count(//o:order[o:line[6]])
- count(//o:order[@status = "open"] | //o:order[o:line[6]])
