(: Pairs of a book and a thesis by the same person. :)
count(for $book in /bibliography/records/book, $thesis in /bibliography/records/thesis
      where $book/author = $thesis/author
      return $thesis)
