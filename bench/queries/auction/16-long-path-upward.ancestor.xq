(: The sellers of the auctions that have such a keyword. :)
for $seller in /site/closed_auctions/closed_auction/annotation/description/parlist
               /listitem/parlist/listitem/text/emph/ancestor::closed_auction/seller
return <seller id="{$seller/@person}"/>
