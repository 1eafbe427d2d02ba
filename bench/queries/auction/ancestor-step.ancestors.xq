(: How many keywords stand in lists within lists. :)
count(//keyword[ancestor::listitem/ancestor::listitem])
