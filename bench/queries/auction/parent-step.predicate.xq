(: How many auctions have a bid of more than 35. :)
count(/site/open_auctions/open_auction[bidder/increase > 35])
