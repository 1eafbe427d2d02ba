(: The emphasized words in texts with a keyword within lists. :)
count(//listitem//text[exists(keyword)]/emph)
