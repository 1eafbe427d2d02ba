(: How many records the people of one country have each. :)
for $person in //person
where $person/country = "Kenya"
return <person name="{$person/name}">{
  count(/bibliography/records/*[some $author in author satisfies $author = $person/name])
}</person>
