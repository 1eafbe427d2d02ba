(: How many keywords stand in lists within lists. :)
count(//keyword[exists(ancestor::listitem[last()]//listitem//keyword intersect .)])
