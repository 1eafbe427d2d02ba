(: Papers printed later than their proceedings, the key passed through functions. :)
count(for $paper in /bibliography/records/paper, $volume in /bibliography/venues/proceedings
      where number(substring($paper/crossref, 6)) = number(substring($volume/@key, 6))
        and $paper/year > $volume/year
      return $paper)
