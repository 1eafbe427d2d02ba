(: Articles in a journal of the country of one of their authors. :)
count(for $article in /bibliography/records/article
      where /bibliography/people/person[name = $article/author]/country
          = /bibliography/venues/journal[@key = $article/journal]/country
      return $article)
