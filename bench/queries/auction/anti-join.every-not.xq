(: How many persons sell nothing. :)
count(for $person in /site/people/person
      where every $seller in /site/open_auctions/open_auction/seller
            satisfies not($seller/@person = $person/@id)
      return $person)
