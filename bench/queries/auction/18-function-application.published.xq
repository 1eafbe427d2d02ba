(: The starting prices in another currency. :)
declare function local:convert($v as xs:decimal?) as xs:decimal? { 2.20371 * $v };
let $auction := (/)
return
  for $i in $auction/site/open_auctions/open_auction
  return local:convert(zero-or-one($i/initial))
