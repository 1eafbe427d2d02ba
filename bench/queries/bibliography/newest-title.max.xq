(: The first title among those of the last year. :)
(for $record in /bibliography/records/*[year = max(/bibliography/records/*/year)]
 order by string($record/title)
 return $record/title/text())[1]
