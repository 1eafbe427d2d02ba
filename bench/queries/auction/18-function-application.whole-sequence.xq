(: The starting prices in another currency. :)
declare function local:converted($amounts) { for $amount in $amounts return 2.20371 * $amount };
local:converted(/site/open_auctions/open_auction/initial)
