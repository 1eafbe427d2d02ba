(: The emphasized words in texts with a keyword within lists. :)
count(//listitem//text/emph[preceding-sibling::keyword or following-sibling::keyword])
