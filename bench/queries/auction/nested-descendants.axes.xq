(: The emphasized words in texts with a keyword within lists. :)
count(/descendant::listitem/descendant::text[child::keyword]/child::emph)
