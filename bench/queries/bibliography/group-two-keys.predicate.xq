(: How many books each publisher has in each year. :)
for $publisher in distinct-values(//book/publisher), $year in distinct-values(//book/year)
let $books := //book[publisher = $publisher and year = $year]
where exists($books)
return <books of="{$publisher}" in="{$year}">{count($books)}</books>
