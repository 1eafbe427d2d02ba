(: How many persons earn more than 50000. :)
count(for $person in /site/people/person where $person/profile/@income > 50000 return $person)
