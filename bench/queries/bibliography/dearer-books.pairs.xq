(: For each book how many in the same currency are dearer. :)
count(for $book in //book, $other in //book
      where $book/price/@currency = $other/price/@currency
        and $other/price + 0 > $book/price + 0
      return $other)
