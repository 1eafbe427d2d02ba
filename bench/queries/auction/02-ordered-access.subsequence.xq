(: The first increase of every open auction. :)
for $auction in /site/open_auctions/open_auction
return <increase>{subsequence($auction/bidder, 1, 1)/increase/text()}</increase>
