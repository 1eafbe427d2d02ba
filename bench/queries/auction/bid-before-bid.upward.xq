(: The auctions in which a bid of 30 or more precedes one of at most 6. :)
count(//bidder[increase >= 30]/following-sibling::bidder[increase <= 6]/..)
