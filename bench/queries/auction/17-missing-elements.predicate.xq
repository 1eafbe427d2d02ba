(: The persons who give no home page. :)
for $person in /site/people/person[not(homepage/text())]
return <person name="{$person/name/text()}"/>
