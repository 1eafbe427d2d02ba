(: The date of the dearest sale. :)
(for $sale in /site/closed_auctions/closed_auction
 order by number($sale/price) descending
 return $sale)[1]/date/text()
