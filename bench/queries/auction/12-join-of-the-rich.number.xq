(: The same for those who earn more than 50000. :)
for $person in /site/people/person
let $income := number($person/profile/@income)
where $income > 50000
return <items income="{$person/profile/@income}">{
  count(for $auction in /site/open_auctions/open_auction
        where $income > 5000 * number($auction/initial)
        return $auction)
}</items>
