(: How many records the people of one country have each. :)
for $person in /bibliography/people/person
where $person/country = "Kenya"
return <person name="{$person/name}">{
  count(for $record in /bibliography/records/* where $record/author = $person/name return $record)
}</person>
