(: The sellers of the auctions that have such a keyword. :)
for $auction in /site/closed_auctions/closed_auction
where exists($auction/annotation/description/parlist/listitem/parlist/listitem/text/emph)
return <seller id="{$auction/seller/@person}"/>
