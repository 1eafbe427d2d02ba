(: How many books nobody cites. :)
count(//book except //book[@key = //cite/@key])
