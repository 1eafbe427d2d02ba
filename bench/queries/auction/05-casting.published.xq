(: How many items sold for 40 or more. :)
let $auction := (/)
return count(for $i in $auction/site/closed_auctions/closed_auction
             where $i/price/text() >= 40
             return $i/price)
