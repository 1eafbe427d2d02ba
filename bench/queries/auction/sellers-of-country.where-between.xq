(: How many auctions are sold by people of one country. :)
count(for $person in /site/people/person
      where $person/address/country = "Kenya"
      return for $auction in /site/open_auctions/open_auction
             where $auction/seller/@person = $person/@id
             return $auction)
