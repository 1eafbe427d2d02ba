(: Every thesis, book and journal article in a form of its own. :)
for $record in /bibliography/records/*
return
  if ($record/self::article) then
    <ref>{string($record/title)}: {string($record/journal)}, {string($record/pages)}</ref>
  else if ($record/self::book) then
    <ref>{string($record/title)} ({string($record/publisher)})</ref>
  else if ($record/self::thesis) then
    <ref>{string($record/title)} at {string($record/school)}</ref>
  else ()
