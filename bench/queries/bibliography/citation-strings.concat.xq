(: Every thesis, book and journal article in a form of its own. :)
for $record in /bibliography/records/*[self::article or self::book or self::thesis]
return <ref>{
  if ($record/journal) then concat($record/title, ": ", $record/journal, ", ", $record/pages)
  else if ($record/publisher) then concat($record/title, " (", $record/publisher, ")")
  else concat($record/title, " at ", $record/school)
}</ref>
