(: For each book how many in the same currency are dearer. :)
sum(for $book in //book
    return count(for $other in //book
                 where $other/price/@currency = $book/price/@currency
                   and xs:decimal($other/price) > xs:decimal($book/price)
                 return $other))
