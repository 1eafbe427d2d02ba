(: Papers printed later than their proceedings, the key passed through functions. :)
count(for $volume in /bibliography/venues/proceedings
      return /bibliography/records/paper[crossref = $volume/@key][year > $volume/year])
