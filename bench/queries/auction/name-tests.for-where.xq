(: How many elements below the regions are items. :)
count(for $node in /site/regions/*/* where name($node) eq "item" return $node)
