(: The date of the dearest sale. :)
for $sale in /site/closed_auctions/closed_auction
where every $price in //closed_auction/price satisfies number($price) <= number($sale/price)
return $sale/date/text()
