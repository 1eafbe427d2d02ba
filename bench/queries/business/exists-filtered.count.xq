(: Whether a cancelled order has a line of nine pieces at a discount of a tenth. :)
declare namespace o = "urn:example:orders";
count(//o:line[@quantity = 9 and @discount = 0.1][../@status = "cancelled"]) > 0
