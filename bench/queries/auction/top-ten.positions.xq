(: The ten dearest sales. :)
let $prices := for $price in //closed_auction/price order by number($price) descending return $price
for $i in 1 to 10
return <sale>{$prices[$i]/text()}</sale>
