(: Whether a cancelled order has a line of nine pieces at a discount of a tenth. :)
declare namespace o = "urn:example:orders";
exists(//o:order[@status = "cancelled"]/o:line[@quantity = 9 and @discount = 0.1])
