(: How many titles contain a piece of a word and stand beside a keyword. :)
count(for $record in /bibliography/records/*
      where contains(string($record/title), "hil") and $record/keyword = "hil"
      return $record)
