(: How many records there are for each year. :)
let $records := /bibliography/records/*
for $year in distinct-values($records/year)
let $members := $records[year = $year]
order by $year
return <year of="{$year}">{count($members)}</year>
