(: How many keywords stand in lists, by sets of nodes. :)
let $listed := //listitem//keyword
let $size := count($listed)
return count(//keyword[count(. | $listed) = $size])
