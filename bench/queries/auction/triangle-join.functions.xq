(: Sales of things in a category that interests the buyer. :)
declare function local:with-id($nodes, $id) { $nodes[@id = $id] };
let $people := /site/people/person, $items := /site/regions/*/item
return count(for $sale in /site/closed_auctions/closed_auction
             where local:with-id($items, $sale/itemref/@item)/incategory/@category
                 = local:with-id($people, $sale/buyer/@person)/profile/interest/@category
             return $sale)
