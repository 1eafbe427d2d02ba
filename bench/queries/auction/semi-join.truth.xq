(: How many persons bought something. :)
count(for $person in /site/people/person
      let $bought := /site/closed_auctions/closed_auction[buyer/@person = $person/@id]
      where $bought
      return $person)
