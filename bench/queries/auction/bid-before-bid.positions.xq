(: The auctions in which a bid of 30 or more precedes one of at most 6. :)
count(for $auction in /site/open_auctions/open_auction
      let $high := for $b at $i in $auction/bidder where $b/increase >= 30 return $i
      let $low := for $b at $i in $auction/bidder where $b/increase <= 6 return $i
      where $high < $low
      return $auction)
