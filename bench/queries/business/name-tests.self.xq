(: How many elements are orders. :)
declare namespace o = "urn:example:orders";
count(//*[self::o:order])
