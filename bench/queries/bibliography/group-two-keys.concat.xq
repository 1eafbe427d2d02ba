(: How many books each publisher has in each year. :)
let $keys := for $book in //book return concat($book/publisher, "|", $book/year)
for $publisher in distinct-values(//book/publisher), $year in distinct-values(//book/year)
let $count := count($keys[. = concat($publisher, "|", $year)])
where $count > 0
return <books of="{$publisher}" in="{$year}">{$count}</books>
