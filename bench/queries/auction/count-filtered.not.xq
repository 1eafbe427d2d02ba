(: How many persons earn more than 50000. :)
count(//person[not(empty(profile/@income)) and not(profile/@income <= 50000)])
