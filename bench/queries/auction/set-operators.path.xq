(: How many keywords stand in lists, by sets of nodes. :)
count(//listitem//keyword)
