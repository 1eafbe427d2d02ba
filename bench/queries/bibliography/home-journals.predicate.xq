(: Articles in a journal of the country of one of their authors. :)
count(/bibliography/records/article
      [for $article in .
       return some $author in author satisfies
         /bibliography/people/person[name = $author]/country
         = /bibliography/venues/journal[@key = $article/journal]/country])
