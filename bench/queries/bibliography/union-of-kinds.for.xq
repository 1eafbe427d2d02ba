(: Articles and books of the first person. :)
let $name := /bibliography/people/person[1]/name
return count(for $record in //article | //book
             where some $author in $record/author satisfies $author = $name
             return $record)
