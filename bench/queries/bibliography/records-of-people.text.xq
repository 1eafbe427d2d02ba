(: How many records the people of one country have each. :)
for $person in /bibliography/people/person[country/text() = "Kenya"]
return <person name="{$person/name/text()}">{
  count(/bibliography/records/*[author/text() = exactly-one($person/name/text())])
}</person>
