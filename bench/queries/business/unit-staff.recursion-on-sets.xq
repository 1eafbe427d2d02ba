(: How many employees every unit has, those of the units below included. :)
declare namespace u = "urn:example:units";
declare function local:staff($units) {
  if (empty($units)) then 0 else count($units/u:employee) + local:staff($units/u:unit)
};
for $unit in //u:unit return local:staff($unit)
