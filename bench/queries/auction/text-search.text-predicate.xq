(: How many items are described with a piece of a word. :)
count(//item[description//text()[contains(., "mihil")]])
