(: The name of the first featured item. :)
let $featured := //item[@featured = "yes"]
let $first := $featured[1]
return $first/name/text()
