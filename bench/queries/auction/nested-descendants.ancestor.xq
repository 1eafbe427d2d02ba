(: The emphasized words in texts with a keyword within lists. :)
count(//text[keyword][ancestor::listitem]/emph)
