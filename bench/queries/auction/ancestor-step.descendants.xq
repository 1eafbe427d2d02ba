(: How many keywords stand in lists within lists. :)
count(//listitem//listitem//keyword)
