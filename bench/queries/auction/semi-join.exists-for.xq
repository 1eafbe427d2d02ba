(: How many persons bought something. :)
count(for $person in /site/people/person
      where exists(for $sale in /site/closed_auctions/closed_auction
                   where $sale/buyer/@person = $person/@id
                   return $sale)
      return $person)
