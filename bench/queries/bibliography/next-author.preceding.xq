(: How many authors precede one who comes before them in the alphabet. :)
count(//author[preceding-sibling::author[1] > .])
