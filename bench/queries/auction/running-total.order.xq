(: The sum of the increases of every auction after each bid. :)
for $auction in /site/open_auctions/open_auction
return <totals>{
  for $bidder in $auction/bidder
  return sum($auction/bidder[. << $bidder or . is $bidder]/increase)
}</totals>
