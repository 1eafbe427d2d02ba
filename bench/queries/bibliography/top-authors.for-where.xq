(: The ten people with most records. :)
(for $name in distinct-values(//author)
 let $records := for $record in /bibliography/records/* where $record/author = $name
                 return $record
 order by count($records) descending
 return <author records="{count($records)}"/>)[position() <= 10]
