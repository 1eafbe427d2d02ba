(: Records whose first author comes after the last one in the alphabet. :)
count(//records/*[author[not(preceding-sibling::author)] > author[not(following-sibling::author)]])
