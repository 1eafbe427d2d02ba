(: Whether some person earns more than 100000 and is at least 60 years old. :)
boolean(//profile[@income > 100000][age >= 60])
