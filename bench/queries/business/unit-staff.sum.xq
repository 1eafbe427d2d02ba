(: How many employees every unit has, those of the units below included. :)
declare namespace u = "urn:example:units";
for $unit in //u:unit
return sum(for $part in $unit/descendant-or-self::u:unit return count($part/u:employee))
