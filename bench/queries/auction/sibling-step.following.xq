(: How many bids are followed by a higher one. :)
count(//bidder[following-sibling::bidder[1]/increase > number(increase)])
