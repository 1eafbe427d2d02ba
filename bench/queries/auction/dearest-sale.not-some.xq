(: The date of the dearest sale. :)
let $sales := /site/closed_auctions/closed_auction
for $sale in $sales
where not(some $other in $sales satisfies number($other/price) > number($sale/price))
return $sale/date/text()
