(: The sum of the increases of every auction after each bid. :)
for $auction in /site/open_auctions/open_auction
return <totals>{
  for $i in 1 to count($auction/bidder) return sum(subsequence($auction/bidder, 1, $i)/increase)
}</totals>
