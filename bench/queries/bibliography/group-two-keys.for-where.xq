(: How many books each publisher has in each year. :)
for $publisher in distinct-values(//book/publisher), $year in distinct-values(//book/year)
let $books := for $book in //book
              where $book/publisher = $publisher and $book/year = $year
              return $book
where not(empty($books))
return <books of="{$publisher}" in="{$year}">{count($books)}</books>
