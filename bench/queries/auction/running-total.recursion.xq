(: The sum of the increases of every auction after each bid. :)
declare function local:totals($sum, $increases) {
  if (empty($increases)) then ()
  else let $next := $sum + $increases[1]
       return ($next, local:totals($next, subsequence($increases, 2)))
};
for $auction in /site/open_auctions/open_auction
return <totals>{local:totals(0, $auction/bidder/increase)}</totals>
