(: For each book how many in the same currency are dearer. :)
count(for $book in //book, $other in //book
      where number($other/price) > number($book/price)
        and $book/price/@currency = $other/price/@currency
      return $other)
