(: How many orders are of the year 2003. :)
declare namespace o = "urn:example:orders";
count(//o:order[(@date cast as xs:date) ge xs:date("2003-01-01")]
               [(@date cast as xs:date) lt xs:date("2004-01-01")])
