(: Sales of things in a category that interests the buyer. :)
count(for $sale in /site/closed_auctions/closed_auction
      let $person := /site/people/person[@id = $sale/buyer/@person]
      let $item := /site/regions/*/item[@id = $sale/itemref/@item]
      where $item/incategory/@category = $person/profile/interest/@category
      return $sale)
