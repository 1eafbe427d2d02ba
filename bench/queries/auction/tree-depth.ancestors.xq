(: How deep the description of an item goes. :)
max(for $node in /site/regions/europe//* return count($node/ancestor::*)) - 2
