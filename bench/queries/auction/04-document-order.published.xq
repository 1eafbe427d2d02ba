(: The reserves of the auctions in which one person bid before another one. :)
let $auction := (/)
return
  for $b in $auction/site/open_auctions/open_auction
  where some $a in $b/bidder/personref[@person = "person14"],
             $c in $b/bidder/personref[@person = "person13"]
        satisfies $a << $c
  return <history>{$b/initial/text()}</history>
