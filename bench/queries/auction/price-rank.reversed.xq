(: How many sales were cheaper than each of the first fifty. :)
for $sale at $i in /site/closed_auctions/closed_auction
where $i <= 50
return count(for $other in /site/closed_auctions/closed_auction
             where xs:decimal($sale/price) > xs:decimal($other/price)
             return $other)
