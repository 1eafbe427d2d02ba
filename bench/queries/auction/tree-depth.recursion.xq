(: How deep the description of an item goes. :)
declare function local:depth($node) {
  if ($node/*) then 1 + max(for $child in $node/* return local:depth($child)) else 1
};
max(for $item in /site/regions/europe/item return local:depth($item))
