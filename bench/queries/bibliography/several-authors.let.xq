(: How many records have more than one author. :)
count(for $record in //records/*
      let $authors := $record/author
      where exists($authors[2])
      return $record)
