(: For every person the number of open auctions that its income could pay five thousand times. :)
declare function local:affords($person, $initial) { $person/profile/@income > 5000 * $initial };
for $person in /site/people/person
let $affordable := for $initial in /site/open_auctions/open_auction/initial
                   where local:affords($person, $initial)
                   return $initial
return <items name="{$person/name/text()}">{count($affordable)}</items>
