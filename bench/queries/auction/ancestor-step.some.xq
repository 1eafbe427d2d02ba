(: How many keywords stand in lists within lists. :)
count(//keyword[some $item in ancestor::listitem satisfies $item/ancestor::listitem])
