(: How many persons bought something. :)
count(for $person in /site/people/person
      where count(/site/closed_auctions/closed_auction[buyer/@person = $person/@id]) > 0
      return $person)
