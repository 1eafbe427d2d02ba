(: The first increase of every open auction. :)
for $auction in /site/open_auctions/open_auction
let $bidders := $auction/bidder
let $first := $bidders[1]
return <increase>{$first/increase/text()}</increase>
