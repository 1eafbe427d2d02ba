(: Whether some person earns more than 100000 and is at least 60 years old. :)
if (//profile[@income > 100000 and age >= 60]/..) then true() else false()
