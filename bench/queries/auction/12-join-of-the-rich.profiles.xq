(: The same for those who earn more than 50000. :)
for $profile in /site/people/person/profile[@income > 50000]
let $affordable := /site/open_auctions/open_auction/initial[5000 * . < $profile/@income]
return <items income="{$profile/@income}">{count($affordable)}</items>
