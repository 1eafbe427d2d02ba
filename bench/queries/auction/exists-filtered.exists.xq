(: Whether some person earns more than 100000 and is at least 60 years old. :)
exists(/site/people/person[profile/@income > 100000][profile/age >= 60])
