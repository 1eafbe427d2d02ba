(: The first title among those of the last year. :)
let $years := for $year in /bibliography/records/*/year return number($year)
return min(for $record in /bibliography/records/*[not(number(year) < $years)]
           return string($record/title))
