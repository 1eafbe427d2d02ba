(: The emphasized words in texts with a keyword within lists. :)
count(//listitem//text[count(keyword) > 0]/emph)
