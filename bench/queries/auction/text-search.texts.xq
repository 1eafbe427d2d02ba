(: How many items are described with a piece of a word. :)
count(//item[some $text in description//text() satisfies contains($text, "mihil")])
