(: How many orders are of the year 2003. :)
declare namespace o = "urn:example:orders";
count(//o:order[xs:date(@date) >= xs:date("2003-01-01")
                and xs:date(@date) <= xs:date("2003-12-31")])
