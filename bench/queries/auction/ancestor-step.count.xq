(: How many keywords stand in lists within lists. :)
count(//keyword[count(ancestor::listitem) > 1])
