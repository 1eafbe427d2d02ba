(: Papers printed later than their proceedings, the key passed through functions. :)
count(for $paper in /bibliography/records/paper, $volume in /bibliography/venues/proceedings
      where $paper/crossref/text() = $volume/@key and $paper/year/text() > $volume/year/text()
      return $paper)
