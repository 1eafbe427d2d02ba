(: The name of the employee who has served longest. :)
declare namespace u = "urn:example:units";
let $first := min(for $date in //u:employee/@since return xs:date($date))
return (//u:employee[xs:date(@since) = $first])[1]/u:name/text()
