(: The number of items of all regions together. :)
sum(for $region in /site/regions/* return count($region/item))
