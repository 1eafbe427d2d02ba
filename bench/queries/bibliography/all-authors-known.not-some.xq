(: Records all of whose authors give a home page. :)
count(for $record in /bibliography/records/*
      where not(some $author in $record/author
                satisfies empty(/bibliography/people/person[name = $author]/homepage))
      return $record)
