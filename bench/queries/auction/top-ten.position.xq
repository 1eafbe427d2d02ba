(: The ten dearest sales. :)
(for $sale in /site/closed_auctions/closed_auction
 order by number($sale/price) descending
 return <sale>{$sale/price/text()}</sale>)[position() <= 10]
