(: The persons who give no home page. :)
for $person in /site/people/person
where count($person/homepage/text()) = 0
return <person name="{$person/name/text()}"/>
