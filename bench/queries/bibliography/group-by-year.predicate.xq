(: How many records there are for each year. :)
for $year in distinct-values(/bibliography/records/*/year)
order by $year
return <year of="{$year}">{count(/bibliography/records/*[year = $year])}</year>
