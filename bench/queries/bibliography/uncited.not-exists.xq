(: How many books nobody cites. :)
count(for $book in //book
      where not(exists(/bibliography/records/*[cite/@key = $book/@key]))
      return $book)
