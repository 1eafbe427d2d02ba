(: The sellers of the auctions that have such a keyword. :)
let $auction := (/)
return
  for $a in $auction/site/closed_auctions/closed_auction
  where not(empty($a/annotation/description/parlist/listitem/parlist/listitem/text/emph))
  return <seller id="{$a/seller/@person}"/>
