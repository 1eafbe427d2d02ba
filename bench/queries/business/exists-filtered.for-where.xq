(: Whether a cancelled order has a line of nine pieces at a discount of a tenth. :)
declare namespace o = "urn:example:orders";
exists(for $order in //o:order, $line in $order/o:line
       where $order/@status = "cancelled" and $line/@quantity = 9 and $line/@discount = 0.1
       return $line)
