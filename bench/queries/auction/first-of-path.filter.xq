(: The name of the first featured item. :)
(//item[@featured = "yes"])[1]/name/text()
