(: For every person the number of open auctions that its income could pay five thousand times. :)
for $person in /site/people/person
return <items name="{$person/name/text()}">{
  count(/site/open_auctions/open_auction/initial[$person/profile/@income > 5000 * .])
}</items>
