(: The sales whose buyers are known, with the key passed through functions. :)
count(for $person in /site/people/person
      let $id := string($person/@id)
      for $sale in /site/closed_auctions/closed_auction
      let $buyer := string($sale/buyer/@person)
      where $buyer eq $id
      return $sale)
