(: The sales whose buyers are known, with the key passed through functions. :)
count(for $person in /site/people/person, $sale in /site/closed_auctions/closed_auction
      where exactly-one($sale/buyer/@person) = exactly-one($person/@id)
      return $sale)
