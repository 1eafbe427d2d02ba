(: How many persons sell nothing. :)
count(for $person in /site/people/person
      let $auctions := /site/open_auctions/open_auction[seller/@person = $person/@id]
      where count($auctions) = 0
      return $person)
