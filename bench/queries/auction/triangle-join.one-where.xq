(: Sales of things in a category that interests the buyer. :)
count(for $sale in /site/closed_auctions/closed_auction, $person in /site/people/person,
          $item in /site/regions/*/item
      where $sale/buyer/@person = $person/@id and $sale/itemref/@item = $item/@id
        and $item/incategory/@category = $person/profile/interest/@category
      return $sale)
