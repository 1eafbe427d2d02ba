(: The name of the last featured item. :)
reverse(//item[@featured = "yes"])[1]/name/text()
