(: The names of items and persons. :)
count(//item/name) + count(//person/name)
