(: Sales of things in a category that interests the buyer. :)
count(for $sale in /site/closed_auctions/closed_auction
      return for $person in /site/people/person
             where $person/@id = $sale/buyer/@person
             return for $item in /site/regions/*/item
                    where $item/@id = $sale/itemref/@item
                      and $item/incategory/@category = $person/profile/interest/@category
                    return $sale)
