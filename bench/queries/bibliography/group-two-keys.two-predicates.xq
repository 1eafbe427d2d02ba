(: How many books each publisher has in each year. :)
let $all := /bibliography/records/book
for $publisher in distinct-values($all/publisher), $year in distinct-values($all/year)
let $books := $all[publisher = $publisher][year = $year]
where $books
return <books of="{$publisher}" in="{$year}">{count($books)}</books>
