(: The ten dearest sales. :)
let $sorted := for $sale in //closed_auction order by -number($sale/price) return $sale
for $sale in $sorted[position() < 11]
return <sale>{$sale/price/text()}</sale>
