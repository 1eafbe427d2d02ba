(: The keywords emphasized deep in the annotations of closed auctions. :)
let $auction := (/)
return
  for $a in $auction/site/closed_auctions/closed_auction/annotation/description/parlist
            /listitem/parlist/listitem/text/emph
  return <text>{$a/text()}</text>
