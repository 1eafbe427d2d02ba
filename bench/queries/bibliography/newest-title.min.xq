(: The first title among those of the last year. :)
min(for $record in /bibliography/records/*
    where $record/year = max(/bibliography/records/*/year)
    return string($record/title))
