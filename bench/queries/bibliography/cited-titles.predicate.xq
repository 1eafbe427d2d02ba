(: The titles that every book cites. :)
for $book in /bibliography/records/book
return <book key="{$book/@key}">{
  for $cite in $book/cite return /bibliography/records/*[@key = $cite/@key]/title
}</book>
