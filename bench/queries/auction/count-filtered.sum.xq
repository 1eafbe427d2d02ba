(: How many persons earn more than 50000. :)
sum(for $person in /site/people/person return if ($person/profile/@income > 50000) then 1 else 0)
