(: How many authors precede one who comes before them in the alphabet. :)
count(//author[following-sibling::*[1]/self::author < .])
