(: Articles in a journal of the country of one of their authors. :)
declare function local:named($people, $names) { $people[name = $names] };
declare function local:keyed($nodes, $key) { $nodes[@key = $key] };
let $people := /bibliography/people/person, $journals := /bibliography/venues/journal
return count(for $article in /bibliography/records/article
             where local:named($people, $article/author)/country
                 = local:keyed($journals, $article/journal)/country
             return $article)
