(: The sales whose buyers are known, with the key passed through functions. :)
count(for $person in /site/people/person, $sale in /site/closed_auctions/closed_auction
      where number(substring($sale/buyer/@person, 7)) = number(substring($person/@id, 7))
      return $sale)
