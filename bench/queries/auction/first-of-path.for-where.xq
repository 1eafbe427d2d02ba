(: The name of the first featured item. :)
(for $item in /site/regions/*/item where $item/@featured = "yes" return $item/name/text())[1]
