(: Whether some person earns more than 100000 and is at least 60 years old. :)
not(empty(/site/people/person/profile[@income > 100000 and age >= 60]))
