(: How many persons bought something. :)
count(for $person in /site/people/person
      where exists(/site/closed_auctions/closed_auction[buyer/@person = $person/@id])
      return $person)
