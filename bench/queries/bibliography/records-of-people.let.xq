(: How many records the people of one country have each. :)
let $authors := /bibliography/records/*/author
for $person in //person[country = "Kenya"]
let $name := string($person/name)
return <person name="{$name}">{count($authors[. = $name])}</person>
