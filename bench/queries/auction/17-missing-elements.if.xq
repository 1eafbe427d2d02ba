(: The persons who give no home page. :)
for $person in /site/people/person
return if ($person/homepage/text()) then () else <person name="{$person/name/text()}"/>
