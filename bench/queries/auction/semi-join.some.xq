(: How many persons bought something. :)
count(for $person in /site/people/person
      where some $sale in /site/closed_auctions/closed_auction
            satisfies $sale/buyer/@person = $person/@id
      return $person)
