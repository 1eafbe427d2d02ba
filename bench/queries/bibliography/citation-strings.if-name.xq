(: Every thesis, book and journal article in a form of its own. :)
for $record in /bibliography/records/*
let $name := local-name($record)
return
  if ($name = "article") then
    <ref>{string($record/title)}: {string($record/journal)}, {string($record/pages)}</ref>
  else if ($name = "book") then
    <ref>{string($record/title)} ({string($record/publisher)})</ref>
  else if ($name = "thesis") then
    <ref>{string($record/title)} at {string($record/school)}</ref>
  else ()
