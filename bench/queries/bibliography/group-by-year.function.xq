(: How many records there are for each year. :)
declare function local:of($records, $year) { $records[year = $year] };
let $records := /bibliography/records/*
for $year in distinct-values($records/year)
order by $year
return <year of="{$year}">{count(local:of($records, $year))}</year>
