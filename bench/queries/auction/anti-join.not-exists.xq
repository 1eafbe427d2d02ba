(: How many persons sell nothing. :)
count(for $person in /site/people/person
      where not(exists(/site/open_auctions/open_auction/seller[@person = $person/@id]))
      return $person)
