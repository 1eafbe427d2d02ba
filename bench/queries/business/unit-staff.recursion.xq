(: How many employees every unit has, those of the units below included. :)
declare namespace u = "urn:example:units";
declare function local:staff($unit) {
  count($unit/u:employee) + sum(for $part in $unit/u:unit return local:staff($part))
};
for $unit in //u:unit return local:staff($unit)
