(: How many books nobody cites. :)
declare function local:citing($cites, $record) { $cites[@key = $record/@key] };
let $cites := //cite
return count(for $book in //book where empty(local:citing($cites, $book)) return $book)
