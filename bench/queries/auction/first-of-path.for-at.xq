(: The name of the first featured item. :)
for $item at $i in //item[@featured = "yes"] where $i = 1 return $item/name/text()
