(: The first increase of every open auction. :)
for $auction in /site/open_auctions/open_auction
return <increase>{$auction/bidder[1]/increase/text()}</increase>
