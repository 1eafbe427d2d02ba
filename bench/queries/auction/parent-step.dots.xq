(: How many auctions have a bid of more than 35. :)
count(//bidder[increase > 35]/..)
