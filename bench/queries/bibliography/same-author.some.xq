(: Pairs of a book and a thesis by the same person. :)
count(for $book in //book, $thesis in //thesis
      where some $author in $book/author satisfies $author = $thesis/author
      return $thesis)
