(: How many persons bought something. :)
count(for $person in /site/people/person
      where not(empty(//closed_auction/buyer[@person = $person/@id]))
      return $person)
