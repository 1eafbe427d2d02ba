(: How many books nobody cites. :)
count(//book[not(some $book in ., $cite in //cite satisfies $cite/@key = $book/@key)])
