(: How many bids are followed by a higher one. :)
count(for $bidder in //bidder
      let $next := $bidder/following-sibling::bidder[1]
      where number($next/increase) > number($bidder/increase)
      return $bidder)
