(: Papers printed later than their proceedings, the key passed through functions. :)
count(for $paper in /bibliography/records/paper, $volume in /bibliography/venues/proceedings
      where zero-or-one($paper/crossref) = zero-or-one($volume/@key)
        and $paper/year > $volume/year
      return $paper)
