(: How many books nobody cites. :)
count(//book) - count(//book[@key = distinct-values(//cite/@key)])
