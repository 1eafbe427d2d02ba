(: How many records there are for each year. :)
let $years := //records/*/year
for $year in distinct-values($years)
order by $year
return <year of="{$year}">{count($years[. = $year])}</year>
