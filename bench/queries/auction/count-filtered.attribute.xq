(: How many persons earn more than 50000. :)
count(/site/people/person/profile/@income[. > 50000])
