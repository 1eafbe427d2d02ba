(: How many auctions have a bid of more than 35. :)
count(for $auction in /site/open_auctions/open_auction
      where exists($auction/bidder[increase > 35])
      return $auction)
