(: For every person the number of open auctions that its income could pay five thousand times. :)
for $person in /site/people/person
return <items name="{$person/name/text()}">{
  sum(for $initial in /site/open_auctions/open_auction/initial
      where $person/profile/@income > 5000 * $initial
      return 1, 0)
}</items>
