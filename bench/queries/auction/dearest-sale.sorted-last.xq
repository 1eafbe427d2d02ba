(: The date of the dearest sale. :)
(for $sale in /site/closed_auctions/closed_auction
 order by number($sale/price)
 return $sale)[last()]/date/text()
