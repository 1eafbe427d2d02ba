(: How many books nobody cites. :)
count(for $book in /bibliography/records/book
      where empty(//cite[@key = $book/@key])
      return $book)
