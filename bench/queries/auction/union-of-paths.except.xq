(: The names of items and persons. :)
count(//name except //category/name)
