(: The auctions whose last increase is at least twice the first one. :)
let $auction := (/)
return
  for $b in $auction/site/open_auctions/open_auction
  where zero-or-one($b/bidder[1]/increase/text()) * 2 <= $b/bidder[last()]/increase/text()
  return <increase first="{$b/bidder[1]/increase/text()}"
                   last="{$b/bidder[last()]/increase/text()}"/>
