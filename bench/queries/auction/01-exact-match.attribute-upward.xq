(: The name of one person, found by its identifier. :)
//@id[. = "person0"]/parent::person/name/text()
