(: How many items sold for 40 or more. :)
declare function local:high($price) { xs:double($price) >= 40 };
count(/site/closed_auctions/closed_auction[local:high(price)])
