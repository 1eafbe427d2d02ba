(: The ten dearest sales. :)
for $sale at $i in (for $sale in /site/closed_auctions/closed_auction
                    order by number($sale/price) descending
                    return $sale)
where $i <= 10
return <sale>{$sale/price/text()}</sale>
