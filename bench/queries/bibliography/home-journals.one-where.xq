(: Articles in a journal of the country of one of their authors. :)
count(for $article in /bibliography/records/article, $journal in /bibliography/venues/journal
      where $article/journal = $journal/@key
        and (some $person in /bibliography/people/person
             satisfies ($person/name = $article/author and $person/country = $journal/country))
      return $article)
