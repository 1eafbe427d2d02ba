(: How many employees every unit has, those of the units below included. :)
declare namespace u = "urn:example:units";
let $employees := //u:employee
for $unit in //u:unit
return count($employees[ancestor::u:unit intersect $unit])
