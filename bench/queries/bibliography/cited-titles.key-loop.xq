(: The titles that every book cites. :)
for $book in /bibliography/records/book
return <book key="{$book/@key}">{
  for $key in $book/cite/@key
  return for $record in //records/* where string($record/@key) eq string($key) return $record/title
}</book>
