(: Whether some person earns more than 100000 and is at least 60 years old. :)
count(//person[profile/@income > 100000 and profile/age >= 60]) > 0
