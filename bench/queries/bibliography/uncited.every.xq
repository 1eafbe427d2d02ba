(: How many books nobody cites. :)
count(for $book in //book
      where every $cite in //cite satisfies $cite/@key != $book/@key
      return $book)
