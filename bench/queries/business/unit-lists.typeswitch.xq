(: The units as lists within lists. :)
declare namespace b = "urn:example:business";
declare namespace u = "urn:example:units";
declare function local:list($node) {
  typeswitch ($node)
    case element(u:unit) return
      <ul title="{$node/@name}">{for $child in $node/* return local:list($child)}</ul>
    case element(u:employee) return <li>{string($node/u:name)}</li>
    default return ()
};
local:list(/b:business/u:unit)
