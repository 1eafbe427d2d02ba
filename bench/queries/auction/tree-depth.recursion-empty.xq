(: How deep the description of an item goes. :)
declare function local:depth($nodes) {
  if (empty($nodes)) then 0 else 1 + local:depth($nodes/*)
};
local:depth(/site/regions/europe/item)
