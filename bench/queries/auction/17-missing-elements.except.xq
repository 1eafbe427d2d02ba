(: The persons who give no home page. :)
for $person in /site/people/person except /site/people/person[homepage/text()]
return <person name="{$person/name/text()}"/>
