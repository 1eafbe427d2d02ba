(: How many persons sell nothing. :)
count(for $person in /site/people/person
      where empty(/site/open_auctions/open_auction[seller/@person = $person/@id])
      return $person)
