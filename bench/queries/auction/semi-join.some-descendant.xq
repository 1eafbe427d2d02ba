(: How many persons bought something. :)
count(for $person in /site/people/person
      where some $buyer in //buyer satisfies $buyer/@person = $person/@id
      return $person)
