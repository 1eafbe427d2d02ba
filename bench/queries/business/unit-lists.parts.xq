(: The units as lists within lists. :)
declare namespace b = "urn:example:business";
declare namespace u = "urn:example:units";
declare function local:list($unit) {
  <ul title="{$unit/@name}">{
    for $employee in $unit/u:employee return <li>{string($employee/u:name)}</li>,
    for $part in $unit/u:unit return local:list($part)
  }</ul>
};
local:list(/b:business/u:unit)
