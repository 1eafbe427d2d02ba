(: The ten people with most records. :)
subsequence(
  for $name in distinct-values(/bibliography/records/*/author)
  let $records := /bibliography/records/*[author = $name]
  order by count($records) descending, $name
  return <author records="{count($records)}"/>, 1, 10)
