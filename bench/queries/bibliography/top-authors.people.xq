(: The ten people with most records. :)
(for $person in /bibliography/people/person
 let $records := /bibliography/records/*[author = $person/name]
 order by count($records) descending
 return <author records="{count($records)}"/>)[position() < 11]
