(: Every thesis, book and journal article in a form of its own. :)
declare function local:tail($record) {
  typeswitch ($record)
    case element(article) return concat(": ", $record/journal, ", ", $record/pages)
    case element(book) return concat(" (", $record/publisher, ")")
    default return concat(" at ", $record/school)
};
for $record in /bibliography/records/(article | book | thesis)
return <ref>{concat($record/title, local:tail($record))}</ref>
