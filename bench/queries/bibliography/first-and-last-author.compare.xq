(: Records whose first author comes after the last one in the alphabet. :)
count(for $authors in /bibliography/records/*
      where compare($authors/author[1], $authors/author[last()]) = 1
      return $authors)
