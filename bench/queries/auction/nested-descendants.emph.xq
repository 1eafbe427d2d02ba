(: The emphasized words in texts with a keyword within lists. :)
count(//emph[parent::text/keyword and ancestor::listitem])
