(: The persons who give no home page. :)
for $person in /site/people/person
where not(exists($person/homepage/text()))
return <person name="{$person/name/text()}"/>
