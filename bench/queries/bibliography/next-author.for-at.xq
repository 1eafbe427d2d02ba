(: How many authors precede one who comes before them in the alphabet. :)
count(for $record in /bibliography/records/*
      for $author at $i in $record/author
      where $record/author[$i + 1] < $author
      return $author)
