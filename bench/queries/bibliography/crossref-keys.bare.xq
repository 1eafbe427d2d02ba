(: Papers printed later than their proceedings, the key passed through functions. :)
count(for $paper in /bibliography/records/paper, $volume in /bibliography/venues/proceedings
      where $paper/crossref = $volume/@key and $paper/year > $volume/year
      return $paper)
