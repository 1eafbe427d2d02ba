(: The sales whose buyers are known, with the key passed through functions. :)
count(for $person in /site/people/person
      let $id := $person/@id
      for $sale in /site/closed_auctions/closed_auction
      let $buyer := $sale/buyer/@person
      where $buyer = $id
      return $sale)
