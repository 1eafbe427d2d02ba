(: How many records the people of one country have each. :)
for $person in /bibliography/people/person[country = "Kenya"]
return <person name="{$person/name}">{count(//author[. = $person/name])}</person>
