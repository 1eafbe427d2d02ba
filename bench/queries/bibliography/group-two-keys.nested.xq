(: How many books each publisher has in each year. :)
let $all := //book
let $years := distinct-values($all/year)
for $publisher in distinct-values($all/publisher)
let $own := $all[publisher = $publisher]
for $year in $years
let $books := $own[year = $year]
where count($books) > 0
return <books of="{$publisher}" in="{$year}">{count($books)}</books>
