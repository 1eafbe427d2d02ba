(: The auctions in which a bid of 30 or more precedes one of at most 6. :)
count(for $auction in /site/open_auctions/open_auction
      where exists(for $a in $auction/bidder[increase >= 30], $b in $auction/bidder[increase <= 6]
                   where $b >> $a
                   return $b)
      return $auction)
