(: For every person the number of open auctions that its income could pay five thousand times. :)
let $limits := for $initial in /site/open_auctions/open_auction/initial return 5000 * $initial
for $person in /site/people/person
return <items name="{$person/name/text()}">{count($limits[. < $person/profile/@income])}</items>
