(: How many persons sell nothing. :)
count(for $person in /site/people/person
      where empty(for $auction in /site/open_auctions/open_auction
                  where $auction/seller/@person = $person/@id
                  return $auction)
      return $person)
