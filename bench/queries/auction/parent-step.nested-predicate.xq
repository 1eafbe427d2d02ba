(: How many auctions have a bid of more than 35. :)
count(//open_auction[bidder[increase > 35]])
