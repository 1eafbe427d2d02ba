(: Papers printed later than their proceedings, the key passed through functions. :)
count(/bibliography/records/paper
      [some $paper in ., $volume in /bibliography/venues/proceedings
       satisfies ($volume/@key = $paper/crossref and $paper/year > $volume/year)])
