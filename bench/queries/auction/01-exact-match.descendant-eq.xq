(: The name of one person, found by its identifier. :)
//person[@id eq "person0"]/name/text()
