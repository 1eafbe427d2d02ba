(: The auctions in which a bid of 30 or more precedes one of at most 6. :)
count(/site/open_auctions/open_auction
      [bidder[increase >= 30]/following-sibling::bidder/increase <= 6])
