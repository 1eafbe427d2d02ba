(: The first title among those of the last year. :)
min(for $record in /bibliography/records/*
    where every $year in distinct-values(/bibliography/records/*/year)
          satisfies $year <= $record/year
    return string($record/title))
