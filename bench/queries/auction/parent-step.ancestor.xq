(: How many auctions have a bid of more than 35. :)
count(//increase[. > 35]/ancestor::open_auction)
