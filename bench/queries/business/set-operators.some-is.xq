(: Open orders of more than five lines. :)
declare namespace o = "urn:example:orders";
let $long := //o:order[o:line[6]]
return count(//o:order[@status = "open"][some $order in $long satisfies . is $order])
