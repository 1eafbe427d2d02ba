(: The name of the last featured item. :)
(/site/regions/*/item[@featured = "yes"])[position() = last()]/name/text()
