(: How many employees every unit has, those of the units below included. :)
declare namespace u = "urn:example:units";
for $unit in //u:unit
return count(for $part in $unit//u:unit | $unit, $employee in $part/u:employee return $employee)
