(: How many bids are followed by a higher one. :)
count(//bidder[following-sibling::*[1][self::bidder]/increase > number(increase)])
