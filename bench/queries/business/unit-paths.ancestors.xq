(: The names of the units above every unit. :)
declare namespace u = "urn:example:units";
for $unit in //u:unit
return <unit path="{string-join(for $name in $unit/ancestor-or-self::u:unit/@name
                                return string($name), '/')}"/>
