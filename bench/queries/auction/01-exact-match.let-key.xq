(: The name of one person, found by its identifier. :)
let $id := "person0"
for $person in /site/people/person
let $own := string($person/@id)
where $own = $id
return $person/name/text()
