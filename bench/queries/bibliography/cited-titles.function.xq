(: The titles that every book cites. :)
declare function local:cited($records, $key) { $records[@key = $key] };
let $records := /bibliography/records/*
for $book in $records/self::book
return <book key="{$book/@key}">{
  for $cite in $book/cite return local:cited($records, $cite/@key)/title
}</book>
