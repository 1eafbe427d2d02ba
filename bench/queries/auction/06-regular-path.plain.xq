(: The number of items of all regions together. :)
for $regions in /site/regions return count($regions//item)
