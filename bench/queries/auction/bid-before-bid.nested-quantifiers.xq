(: The auctions in which a bid of 30 or more precedes one of at most 6. :)
count(for $auction in /site/open_auctions/open_auction
      where some $a in $auction/bidder[increase >= 30]
            satisfies some $b in $auction/bidder[increase <= 6] satisfies $a << $b
      return $auction)
