(: The name of one person, found by its identifier. :)
/site/people/person[@id = "person0"]/name/text()
