(: The European items that every person bought, by name. :)
let $auction := (/)
let $ca := $auction/site/closed_auctions/closed_auction
return
  let $ei := $auction/site/regions/europe/item
  for $p in $auction/site/people/person
  let $a :=
    for $t in $ca
    where $p/@id = $t/buyer/@person
    return
      for $t2 in $ei
      where $t/itemref/@item = $t2/@id
      return <item>{$t2/name/text()}</item>
  return <person name="{$p/name/text()}">{$a}</person>
