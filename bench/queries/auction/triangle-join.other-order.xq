(: Sales of things in a category that interests the buyer. :)
count(for $item in /site/regions/*/item, $person in /site/people/person,
          $sale in /site/closed_auctions/closed_auction
      where $item/incategory/@category = $person/profile/interest/@category
        and $item/@id = $sale/itemref/@item
        and $person/@id = $sale/buyer/@person
      return $sale)
