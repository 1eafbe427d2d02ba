(: How many records there are for each year. :)
for $year in distinct-values(/bibliography/records/*/year)
order by $year
return <year of="{$year}">{
  count(for $record in /bibliography/records/* where $record/year = $year return $record)
}</year>
