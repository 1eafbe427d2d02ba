(: How many employees every unit has, those of the units below included. :)
declare namespace b = "urn:example:business";
declare namespace u = "urn:example:units";
for $unit in /b:business/u:unit/descendant-or-self::u:unit
return count($unit/descendant::u:employee)
