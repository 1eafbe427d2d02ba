(: The name of the last featured item. :)
let $featured := //item[@featured = "yes"]
return $featured[count($featured)]/name/text()
