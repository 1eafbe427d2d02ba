(: The same for those who earn more than 50000. :)
for $person in /site/people/person[profile/@income > 50000]
return <items income="{$person/profile/@income}">{
  count(/site/open_auctions/open_auction/initial[$person/profile/@income > 5000 * .])
}</items>
