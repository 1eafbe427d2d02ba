(: The first increase of every open auction. :)
let $auction := (/)
return
  for $b in $auction/site/open_auctions/open_auction
  return <increase>{$b/bidder[1]/increase/text()}</increase>
