(: How many orders are of the year 2003. :)
declare namespace o = "urn:example:orders";
count(for $order in //o:order where substring-before($order/@date, "-") eq "2003" return $order)
