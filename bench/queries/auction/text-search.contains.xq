(: How many items are described with a piece of a word. :)
count(/site/regions/*/item[contains(description, "mihil")])
