(: The auctions whose last increase is at least twice the first one. :)
for $auction in /site/open_auctions/open_auction
let $first := $auction/bidder[position() = 1]/increase
let $last := $auction/bidder[position() = last()]/increase
where number($first) * 2 <= number($last)
return <increase first="{$first/text()}" last="{$last/text()}"/>
