(: Whether some person earns more than 100000 and is at least 60 years old. :)
exists(for $person in /site/people/person
       where $person/profile/@income > 100000 and $person/profile/age >= 60
       return $person)
