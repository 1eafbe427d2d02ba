(: Papers printed later than their proceedings, the key passed through functions. :)
count(for $paper in /bibliography/records/paper
      where $paper/year > /bibliography/venues/proceedings[@key = $paper/crossref]/year
      return $paper)
