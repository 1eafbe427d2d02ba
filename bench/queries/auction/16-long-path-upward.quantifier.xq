(: The sellers of the auctions that have such a keyword. :)
for $auction in /site/closed_auctions/closed_auction
where some $text in $auction/annotation/description/parlist/listitem/parlist/listitem/text
      satisfies $text/emph
return <seller id="{$auction/seller/@person}"/>
