(: The name of one person, found by its identifier. :)
let $auction := (/)
return for $b in $auction/site/people/person[@id = "person0"] return $b/name/text()
