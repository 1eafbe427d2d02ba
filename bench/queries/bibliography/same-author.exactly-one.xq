(: Pairs of a book and a thesis by the same person. :)
count(for $thesis in //thesis, $book in //book
      where exactly-one($thesis/author) = $book/author
      return $thesis)
