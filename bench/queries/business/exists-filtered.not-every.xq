(: Whether a cancelled order has a line of nine pieces at a discount of a tenth. :)
declare namespace o = "urn:example:orders";
not(every $order in //o:order[@status = "cancelled"]
    satisfies empty($order/o:line[@quantity = 9 and @discount = 0.1]))
