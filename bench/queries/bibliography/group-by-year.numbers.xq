(: How many records there are for each year. :)
let $years := for $year in /bibliography/records/*/year return xs:integer($year)
for $year in distinct-values($years)
order by $year
return <year of="{$year}">{count($years[. eq $year])}</year>
