(: The name of the last featured item. :)
(for $item in /site/regions/*/item where $item/@featured = "yes" return $item/name/text())[last()]
