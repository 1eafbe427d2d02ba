(: How many items are described with a piece of a word. :)
count(//item[string-length(substring-after(description, "mihil")) > 0])
