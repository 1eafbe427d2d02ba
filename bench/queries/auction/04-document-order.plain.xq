(: The reserves of the auctions in which one person bid before another one. :)
for $auction in /site/open_auctions/open_auction
where some $a in $auction/bidder/personref[@person = "person14"],
           $b in $auction/bidder/personref[@person = "person13"]
      satisfies $a << $b
return <history>{$auction/initial/text()}</history>
