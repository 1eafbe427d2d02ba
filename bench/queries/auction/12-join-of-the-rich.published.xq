(: The same for those who earn more than 50000. :)
let $auction := (/)
return
  for $p in $auction/site/people/person
  let $l := for $i in $auction/site/open_auctions/open_auction/initial
            where $p/profile/@income > 5000 * exactly-one($i/text())
            return $i
  where $p/profile/@income > 50000
  return <items income="{$p/profile/@income}">{count($l)}</items>
