(: How many items are described with a piece of a word. :)
count(//item[contains(string(description), "mihil")])
