(: Every thesis, book and journal article in a form of its own. :)
for $record in /bibliography/records/*
return typeswitch ($record)
  case $article as element(article) return
    <ref>{string($article/title)}: {string($article/journal)}, {string($article/pages)}</ref>
  case $book as element(book) return
    <ref>{string($book/title)} ({string($book/publisher)})</ref>
  case $thesis as element(thesis) return
    <ref>{string($thesis/title)} at {string($thesis/school)}</ref>
  default return ()
