(: The number of items of all regions together. :)
count(for $region in /site/regions/* for $item in $region/item return $item)
