(: How many authors precede one who comes before them in the alphabet. :)
count(//author[following-sibling::author[1] < .])
