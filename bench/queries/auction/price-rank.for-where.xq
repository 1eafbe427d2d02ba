(: How many sales were cheaper than each of the first fifty. :)
for $sale in subsequence(/site/closed_auctions/closed_auction, 1, 50)
return count(for $other in /site/closed_auctions/closed_auction
             where number($other/price) < number($sale/price)
             return $other)
