(: Pairs of a book and a thesis by the same person. :)
let $theses := /bibliography/records/thesis
return count(for $book in /bibliography/records/book
             let $same := $theses[author = $book/author]
             return $same)
