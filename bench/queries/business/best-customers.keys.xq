(: The ten customers with most lines. :)
declare namespace o = "urn:example:orders";
let $keys := for $line in //o:line return string($line/../@customer)
return subsequence(for $id in distinct-values($keys)
                   let $count := count($keys[. = $id])
                   order by $count descending
                   return <lines>{$count}</lines>, 1, 10)
