(: The number of items of all regions together. :)
count(/site/regions/*/item)
