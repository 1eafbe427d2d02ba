(: The number of items of all regions together. :)
let $auction := (/)
return for $b in $auction//site/regions return count($b//item)
