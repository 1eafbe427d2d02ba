(: For every person the number of open auctions that its income could pay five thousand times. :)
for $person in /site/people/person
let $income := $person/profile/@income
let $affordable := /site/open_auctions/open_auction[initial * 5000 < $income]
return <items name="{$person/name/text()}">{count($affordable)}</items>
