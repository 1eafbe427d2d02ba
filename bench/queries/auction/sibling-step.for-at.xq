(: How many bids are followed by a higher one. :)
count(for $auction in /site/open_auctions/open_auction
      for $bidder at $i in $auction/bidder
      where $auction/bidder[$i + 1]/increase > number($bidder/increase)
      return $bidder)
