(: For each book how many in the same currency are dearer. :)
let $books := /bibliography/records/book
return sum(for $book in $books
           return count($books[price/@currency = $book/price/@currency]
                              [number(price) > number($book/price)]))
