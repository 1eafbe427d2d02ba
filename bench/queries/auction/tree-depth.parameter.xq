(: How deep the description of an item goes. :)
declare function local:deepest($node, $depth) {
  if (exists($node/*)) then max(for $child in $node/* return local:deepest($child, $depth + 1))
  else $depth
};
max(for $item in /site/regions/europe/item return local:deepest($item, 1))
