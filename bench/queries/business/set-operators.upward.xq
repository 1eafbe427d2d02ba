(: Open orders of more than five lines. :)
declare namespace o = "urn:example:orders";
count(//o:line[6]/parent::o:order/self::o:order[@status = "open"])
