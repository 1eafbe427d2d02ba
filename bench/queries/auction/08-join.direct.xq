(: What every person bought, as a number. :)
for $person in /site/people/person
return <item person="{$person/name/text()}">{
  count(/site/closed_auctions/closed_auction[buyer/@person = $person/@id])
}</item>
