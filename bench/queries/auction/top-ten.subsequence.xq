(: The ten dearest sales. :)
subsequence(for $sale in /site/closed_auctions/closed_auction
            order by xs:decimal($sale/price) descending
            return <sale>{$sale/price/text()}</sale>, 1, 10)
