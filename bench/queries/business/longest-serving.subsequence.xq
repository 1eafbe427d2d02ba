(: The name of the employee who has served longest. :)
declare namespace u = "urn:example:units";
subsequence(for $employee in //u:employee
            order by data($employee/@since)
            return $employee/u:name/text(), 1, 1)
