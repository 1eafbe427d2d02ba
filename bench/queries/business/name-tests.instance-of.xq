(: How many elements are orders. :)
declare namespace o = "urn:example:orders";
count(//*[. instance of element(o:order)])
