(: The titles that every book cites. :)
for $book in /bibliography/records/book
return <book key="{$book/@key}">{
  for $title in (for $cite in $book/cite return //*[@key = $cite/@key]/title) return $title
}</book>
