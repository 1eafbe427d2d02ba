(: How many auctions have a bid of more than 35. :)
count(//increase[. > 35]/parent::bidder/parent::open_auction)
