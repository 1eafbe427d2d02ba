(: How many items are described with a piece of a word. :)
count(//item[matches(description, "mihil")])
