(: How many auctions have a bid of more than 35. :)
let $bidders := //bidder[increase > 35]
return count(//open_auction intersect $bidders/..)
