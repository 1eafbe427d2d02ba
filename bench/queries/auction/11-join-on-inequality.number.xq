(: For every person the number of open auctions that its income could pay five thousand times. :)
for $person in /site/people/person
let $income := number($person/profile/@income)
let $affordable := for $initial in /site/open_auctions/open_auction/initial
                   where $income > 5000 * number($initial)
                   return $initial
return <items name="{$person/name/text()}">{count($affordable)}</items>
