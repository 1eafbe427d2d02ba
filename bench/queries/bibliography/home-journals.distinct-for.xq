(: Articles in a journal of the country of one of their authors. :)
count(for $article in /bibliography/records/article
      where exists(for $person in /bibliography/people/person,
                       $journal in /bibliography/venues/journal
                   where $person/name = $article/author and $journal/@key = $article/journal
                     and $person/country = $journal/country
                   return $person)
      return $article)
