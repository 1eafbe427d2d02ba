(: The name of one person, found by its identifier. :)
for $person in /site/people/person
where $person/@id = "person0"
return $person/name/text()
