(: The name of the employee who has served longest. :)
declare namespace u = "urn:example:units";
(for $employee in //u:employee order by string($employee/@since) return $employee)[1]/u:name/text()
