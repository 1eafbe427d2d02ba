(: How many records there are for each year. :)
for $year in min(//records/*/year) to max(//records/*/year)
let $members := /bibliography/records/*[year = $year]
where exists($members)
return <year of="{$year}">{count($members)}</year>
