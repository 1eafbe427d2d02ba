(: The name of the first featured item. :)
(/site/regions/*/item[@featured = "yes"])[position() = 1]/name/text()
