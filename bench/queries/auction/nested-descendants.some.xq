(: The emphasized words in texts with a keyword within lists. :)
count(for $text in //listitem//text where some $k in $text/keyword satisfies true()
      return $text/emph)
