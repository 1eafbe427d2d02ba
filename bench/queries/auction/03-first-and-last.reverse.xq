(: The auctions whose last increase is at least twice the first one. :)
for $auction in /site/open_auctions/open_auction
let $first := $auction/bidder[1]/increase
let $last := reverse($auction/bidder)[1]/increase
where $first * 2 <= $last + 0
return <increase first="{$first/text()}" last="{$last/text()}"/>
