(: The names of the units above every unit. :)
declare namespace u = "urn:example:units";
declare function local:names($unit) {
  if (empty($unit)) then () else (local:names($unit/parent::u:unit), string($unit/@name))
};
for $unit in //u:unit return <unit path="{string-join(local:names($unit), '/')}"/>
