(: The first title among those of the last year. :)
let $last := max(//records/*/year)
return subsequence(for $title in //records/*[year = $last]/title
                   order by string($title) return $title/text(), 1, 1)
