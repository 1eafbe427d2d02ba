(: Papers printed later than their proceedings, the key passed through functions. :)
count(for $paper in /bibliography/records/paper, $volume in /bibliography/venues/proceedings
      where data($volume/@key) = data($paper/crossref) and $volume/year < $paper/year
      return $paper)
