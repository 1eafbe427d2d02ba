(: The ten people with most records. :)
let $authors := //author
return subsequence(
  for $name in distinct-values($authors)
  let $count := count($authors[. = $name])
  order by $count descending
  return <author records="{$count}"/>, 1, 10)
