(: How many employees every unit has, those of the units below included. :)
declare namespace u = "urn:example:units";
for $unit in //u:unit return count($unit//u:employee)
