(: Payments of the whole amount of shipped orders, by the number of the order. :)
declare namespace o = "urn:example:orders";
count(//o:payment[@order = //o:order[@status = "shipped"]/@number])
