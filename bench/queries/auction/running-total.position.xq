(: The sum of the increases of every auction after each bid. :)
for $auction in /site/open_auctions/open_auction
return <totals>{
  for $bidder at $i in $auction/bidder return sum($auction/bidder[position() <= $i]/increase)
}</totals>
