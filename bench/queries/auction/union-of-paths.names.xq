(: The names of items and persons. :)
count(//item/name | //person/name)
