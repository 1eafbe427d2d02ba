(: How many records have more than one author. :)
count(for $record in //records/* where count($record/author) ge 2 return $record)
