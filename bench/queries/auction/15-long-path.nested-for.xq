(: The keywords emphasized deep in the annotations of closed auctions. :)
for $auction in /site/closed_auctions/closed_auction
for $outer in $auction/annotation/description/parlist/listitem
for $inner in $outer/parlist/listitem
for $keyword in $inner/text/emph
return <text>{$keyword/text()}</text>
