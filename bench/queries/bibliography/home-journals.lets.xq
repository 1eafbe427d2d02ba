(: Articles in a journal of the country of one of their authors. :)
let $people := //person, $journals := //venues/journal
return count(for $article in //article
             let $journal := $journals[@key = $article/journal]
             let $authors := $people[name = $article/author]
             where $authors/country = $journal/country
             return $article)
