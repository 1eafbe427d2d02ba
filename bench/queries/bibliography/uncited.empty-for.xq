(: How many books nobody cites. :)
count(for $book in /bibliography/records/book
      where empty(for $cite in /bibliography/records/*/cite
                  where $cite/@key = $book/@key return $cite)
      return $book)
