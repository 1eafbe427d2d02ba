(: The name of the employee who has served longest. :)
declare namespace u = "urn:example:units";
(for $employee in //u:employee
 where every $date in //u:employee/@since satisfies $date >= $employee/@since
 return $employee/u:name/text())[1]
