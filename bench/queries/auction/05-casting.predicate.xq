(: How many items sold for 40 or more. :)
count(/site/closed_auctions/closed_auction[price >= 40]/price)
