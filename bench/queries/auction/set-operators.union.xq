(: How many keywords stand in lists, by sets of nodes. :)
count(//keyword) + count(//listitem//keyword) - count(//keyword | //listitem//keyword)
