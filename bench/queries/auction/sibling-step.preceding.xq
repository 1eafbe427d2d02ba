(: How many bids are followed by a higher one. :)
count(//bidder[preceding-sibling::bidder[1]/increase < number(increase)])
