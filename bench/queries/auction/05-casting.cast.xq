(: How many items sold for 40 or more. :)
count(//closed_auction/price[(. cast as xs:decimal) ge 40])
