(: The name of one person, found by its identifier. :)
/site/people/person[some $id in @id satisfies $id = "person0"]/name/text()
