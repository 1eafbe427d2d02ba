(: How many persons sell nothing. :)
count(for $person in /site/people/person
      where not(some $auction in /site/open_auctions/open_auction
                satisfies $auction/seller/@person = $person/@id)
      return $person)
