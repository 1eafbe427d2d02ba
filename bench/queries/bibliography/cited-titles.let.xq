(: The titles that every book cites. :)
let $records := /bibliography/records/*
for $book in /bibliography/records/book
return <book key="{$book/@key}">{
  for $cite in $book/cite
  let $key := string($cite/@key)
  return $records[string(@key) = $key]/title
}</book>
