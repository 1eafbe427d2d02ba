(: How many sales were cheaper than each of the first fifty. :)
for $sale in /site/closed_auctions/closed_auction[position() <= 50]
return sum(for $other in //closed_auction
           return if ($other/price + 0 < $sale/price + 0) then 1 else 0)
