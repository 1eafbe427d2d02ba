(: Sales of things in a category that interests the buyer. :)
count(for $sale in /site/closed_auctions/closed_auction,
          $person in /site/people/person[@id = $sale/buyer/@person],
          $item in /site/regions/*/item[@id = $sale/itemref/@item]
                   [incategory/@category = $person/profile/interest/@category]
      return $sale)
