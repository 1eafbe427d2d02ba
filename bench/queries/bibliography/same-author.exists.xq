(: Pairs of a book and a thesis by the same person. :)
count(for $book in //book, $thesis in //thesis
      where exists($book/author[. = $thesis/author])
      return $thesis)
