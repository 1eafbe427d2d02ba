(: Records whose first author comes after the last one in the alphabet. :)
count(for $record in /bibliography/records/*
      let $first := $record/author[1], $last := $record/author[last()]
      where string($first) > string($last)
      return $record)
