(: The name of the employee who has served longest. :)
declare namespace u = "urn:example:units";
(//u:employee[@since = min(for $e in //u:employee return string($e/@since))])[1]/u:name/text()
