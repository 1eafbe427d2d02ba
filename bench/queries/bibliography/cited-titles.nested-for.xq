(: The titles that every book cites. :)
for $book in /bibliography/records/book
return <book key="{$book/@key}">{
  for $cite in $book/cite, $record in /bibliography/records/*
  where $record/@key = $cite/@key
  return $record/title
}</book>
