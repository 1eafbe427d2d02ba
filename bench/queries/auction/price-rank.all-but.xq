(: How many sales were cheaper than each of the first fifty. :)
let $all := /site/closed_auctions/closed_auction
for $sale in $all[position() <= 50]
return count($all) - count($all[number(price) >= number($sale/price)])
