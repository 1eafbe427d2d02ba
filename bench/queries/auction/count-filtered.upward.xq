(: How many persons earn more than 50000. :)
count(//profile[@income > 50000]/..)
