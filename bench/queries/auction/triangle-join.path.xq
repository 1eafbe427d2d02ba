(: Sales of things in a category that interests the buyer. :)
count(/site/closed_auctions/closed_auction
      [for $sale in .
       return /site/regions/*/item[@id = $sale/itemref/@item]/incategory/@category
            = /site/people/person[@id = $sale/buyer/@person]/profile/interest/@category])
