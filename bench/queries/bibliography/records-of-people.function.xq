(: How many records the people of one country have each. :)
declare function local:by($records, $name) { $records[author = $name] };
let $records := /bibliography/records/*
for $person in /bibliography/people/person[country = "Kenya"]
return <person name="{$person/name}">{count(local:by($records, $person/name))}</person>
