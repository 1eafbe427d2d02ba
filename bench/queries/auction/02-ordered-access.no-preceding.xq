(: The first increase of every open auction. :)
for $auction in /site/open_auctions/open_auction
return <increase>{$auction/bidder[not(preceding-sibling::bidder)]/increase/text()}</increase>
