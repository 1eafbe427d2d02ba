(: Whether a cancelled order has a line of nine pieces at a discount of a tenth. :)
declare namespace o = "urn:example:orders";
not(empty(//o:order[@status = "cancelled"]/o:line[@quantity = 9][@discount = 0.1]))
