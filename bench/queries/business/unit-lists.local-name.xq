(: The units as lists within lists. :)
declare namespace b = "urn:example:business";
declare namespace u = "urn:example:units";
declare function local:list($nodes) {
  for $node in $nodes
  return if (local-name($node) = "unit")
         then element ul {attribute title {string($node/@name)}, local:list($node/*)}
         else element li {string($node/*)}
};
local:list(/b:business/u:unit)
