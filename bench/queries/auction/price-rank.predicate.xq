(: How many sales were cheaper than each of the first fifty. :)
for $sale in /site/closed_auctions/closed_auction[position() <= 50]
let $price := number($sale/price)
return count(/site/closed_auctions/closed_auction[number(price) < $price])
