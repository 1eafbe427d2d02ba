(: How many bids are followed by a higher one. :)
count(for $auction in /site/open_auctions/open_auction, $i in 2 to count($auction/bidder)
      where number($auction/bidder[$i]/increase) > number($auction/bidder[$i - 1]/increase)
      return $i)
