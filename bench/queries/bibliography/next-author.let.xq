(: How many authors precede one who comes before them in the alphabet. :)
count(for $author in /bibliography/records/*/author
      let $next := $author/following-sibling::author[1]
      where string($next) < string($author) and exists($next)
      return $author)
