(: The auctions whose last increase is at least twice the first one. :)
for $auction in /site/open_auctions/open_auction[bidder[1]/increase * 2 <= bidder[last()]/increase]
return <increase first="{$auction/bidder[1]/increase/text()}"
                 last="{$auction/bidder[last()]/increase/text()}"/>
