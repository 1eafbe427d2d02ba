(: The sellers of the auctions that have such a keyword. :)
for $auction in /site/closed_auctions/closed_auction
where count($auction/annotation/description/parlist/listitem/parlist/listitem/text/emph) > 0
return <seller id="{$auction/seller/@person}"/>
