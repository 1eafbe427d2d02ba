(: The names of the units above every unit. :)
declare namespace u = "urn:example:units";
declare function local:path($unit) {
  if ($unit/parent::u:unit) then concat(local:path($unit/..), "/", $unit/@name)
  else string($unit/@name)
};
for $unit in //u:unit return <unit path="{local:path($unit)}"/>
