(: How many pieces of prose there are. :)
sum((count(//description), count(//annotation), count(//emailaddress)))
