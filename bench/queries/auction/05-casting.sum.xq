(: How many items sold for 40 or more. :)
sum(for $sale in /site/closed_auctions/closed_auction
    return if ($sale/price >= 40) then 1 else 0)
