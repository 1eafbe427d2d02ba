(: The names of the units above every unit. :)
declare namespace b = "urn:example:business";
declare namespace u = "urn:example:units";
declare function local:paths($unit, $path) {
  let $own := concat($path, $unit/@name)
  return (<unit path="{$own}"/>,
          for $part in $unit/u:unit return local:paths($part, concat($own, "/")))
};
local:paths(/b:business/u:unit, "")
