(: The first increase of every open auction. :)
for $auction in /site/open_auctions/open_auction
return <increase>{
  for $bidder at $i in $auction/bidder where $i = 1 return $bidder/increase/text()
}</increase>
