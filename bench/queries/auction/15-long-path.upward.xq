(: The keywords emphasized deep in the annotations of closed auctions. :)
for $keyword in //emph[parent::text/parent::listitem/parent::parlist/parent::listitem
                       /parent::parlist/parent::description/parent::annotation
                       /parent::closed_auction]
return <text>{$keyword/text()}</text>
