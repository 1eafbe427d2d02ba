(: The name of the employee who has served longest. :)
declare namespace u = "urn:example:units";
let $dates := distinct-values(//u:employee/@since)
return (for $employee in //u:employee
        where not(some $date in $dates satisfies $date < $employee/@since)
        return $employee/u:name/text())[1]
