(: How many sales were cheaper than each of the first fifty. :)
let $prices := for $price in /site/closed_auctions/closed_auction/price return number($price)
for $sale in /site/closed_auctions/closed_auction[position() <= 50]
return count($prices[. lt number($sale/price)])
