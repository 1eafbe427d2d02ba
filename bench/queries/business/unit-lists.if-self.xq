(: The units as lists within lists. :)
declare namespace b = "urn:example:business";
declare namespace u = "urn:example:units";
declare function local:list($node) {
  if ($node/self::u:unit)
  then <ul title="{$node/@name}">{for $child in $node/* return local:list($child)}</ul>
  else <li>{string($node/u:name)}</li>
};
local:list(/b:business/u:unit)
