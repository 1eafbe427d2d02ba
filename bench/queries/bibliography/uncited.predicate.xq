(: How many books nobody cites. :)
count(/bibliography/records/book[not(@key = //cite/@key)])
