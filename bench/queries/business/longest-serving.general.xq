(: The name of the employee who has served longest. :)
declare namespace u = "urn:example:units";
let $dates := //u:employee/@since
return (//u:employee[not(@since > $dates)])[1]/u:name/text()
