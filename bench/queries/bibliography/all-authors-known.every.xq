(: Records all of whose authors give a home page. :)
count(for $record in /bibliography/records/*
      where every $author in $record/author
            satisfies $author = /bibliography/people/person[homepage]/name
      return $record)
