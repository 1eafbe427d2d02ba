(: Records all of whose authors give a home page. :)
declare function local:known($people, $name) { exists($people[name = $name]/homepage) };
let $people := /bibliography/people/person
return count(for $record in /bibliography/records/*
             where every $author in $record/author satisfies local:known($people, $author)
             return $record)
