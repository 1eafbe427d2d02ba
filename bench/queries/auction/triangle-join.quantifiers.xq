(: Sales of things in a category that interests the buyer. :)
count(for $sale in /site/closed_auctions/closed_auction
      where some $person in /site/people/person satisfies
              ($person/@id = $sale/buyer/@person and
               (some $item in /site/regions/*/item satisfies
                  ($item/@id = $sale/itemref/@item
                   and $item/incategory/@category = $person/profile/interest/@category)))
      return $sale)
