(: How many items sold for 40 or more. :)
count(for $sale in /site/closed_auctions/closed_auction
      where xs:decimal($sale/price) >= 40
      return $sale/price)
