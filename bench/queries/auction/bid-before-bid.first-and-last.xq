(: The auctions in which a bid of 30 or more precedes one of at most 6. :)
count(for $auction in /site/open_auctions/open_auction
      where $auction/bidder[increase >= 30][1] << $auction/bidder[increase <= 6][last()]
      return $auction)
