(: Papers printed later than their proceedings, the key passed through functions. :)
count(for $paper in /bibliography/records/paper
      let $key := $paper/crossref, $year := $paper/year
      for $volume in /bibliography/venues/proceedings
      let $own := $volume/@key
      where $own = $key and $volume/year < $year
      return $paper)
