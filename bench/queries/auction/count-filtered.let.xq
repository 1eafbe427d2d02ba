(: How many persons earn more than 50000. :)
let $limit := 50000
let $rich := for $person in //person let $income := $person/profile/@income
             where $income > $limit return $person
return count($rich)
