(: The first increase of every open auction. :)
for $auction in /site/open_auctions/open_auction
return <increase>{$auction/bidder[position() = 1]/increase/text()}</increase>
