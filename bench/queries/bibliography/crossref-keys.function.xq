(: Papers printed later than their proceedings, the key passed through functions. :)
declare function local:volume($all, $paper) { $all[@key = $paper/crossref] };
let $all := /bibliography/venues/proceedings
return count(for $paper in /bibliography/records/paper
             where $paper/year > local:volume($all, $paper)/year
             return $paper)
