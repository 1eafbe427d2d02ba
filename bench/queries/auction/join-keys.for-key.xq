(: The sales whose buyers are known, with the key passed through functions. :)
count(for $person in /site/people/person, $sale in /site/closed_auctions/closed_auction,
          $buyer in $sale/buyer/@person
      where $buyer = $person/@id
      return $sale)
