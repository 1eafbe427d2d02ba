(: The sales whose buyers are known, with the key passed through functions. :)
count(for $person in /site/people/person, $sale in /site/closed_auctions/closed_auction
      where lower-case($sale/buyer/@person) = lower-case($person/@id)
      return $sale)
