(: Whether some person earns more than 100000 and is at least 60 years old. :)
some $person in /site/people/person
satisfies ($person/profile/@income > 100000 and $person/profile/age >= 60)
