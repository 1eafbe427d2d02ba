(: The same for those who earn more than 50000. :)
for $person in /site/people/person
let $affordable :=
  for $initial in /site/open_auctions/open_auction/initial
  where $person/profile/@income > 5000 * $initial
  return $initial
where $person/profile/@income > 50000
return <items income="{$person/profile/@income}">{count($affordable)}</items>
