(: The name of the last featured item. :)
(//item[@featured = "yes"])[last()]/name/text()
