(: How many persons earn more than 50000. :)
count(//person[profile/@income > 50000])
