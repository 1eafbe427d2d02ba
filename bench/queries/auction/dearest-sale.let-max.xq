(: The date of the dearest sale. :)
let $highest := max(for $price in //closed_auction/price return number($price))
return //closed_auction[price = $highest]/date/text()
