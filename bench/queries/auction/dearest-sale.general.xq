(: The date of the dearest sale. :)
let $prices := for $price in //closed_auction/price return number($price)
return //closed_auction[not(number(price) < $prices)]/date/text()
