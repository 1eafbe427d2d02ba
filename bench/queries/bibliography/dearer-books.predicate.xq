(: For each book how many in the same currency are dearer. :)
sum(for $book in //book
    return count(//book[price/@currency = $book/price/@currency
                        and number(price) > number($book/price)]))
