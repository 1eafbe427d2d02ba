(: How many auctions have a bid of more than 35. :)
count(for $auction in //open_auction
      where some $increase in $auction/bidder/increase satisfies $increase > 35
      return $auction)
