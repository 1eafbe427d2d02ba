(: How many books nobody cites. :)
count(for $book in //book where count(//cite[@key = $book/@key]) = 0 return $book)
