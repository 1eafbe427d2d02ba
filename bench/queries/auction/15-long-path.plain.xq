(: The keywords emphasized deep in the annotations of closed auctions. :)
for $keyword in /site/closed_auctions/closed_auction/annotation/description/parlist
                /listitem/parlist/listitem/text/emph
return <text>{$keyword/text()}</text>
