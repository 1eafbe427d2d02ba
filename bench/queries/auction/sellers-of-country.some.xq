(: How many auctions are sold by people of one country. :)
count(for $auction in /site/open_auctions/open_auction
      where some $person in /site/people/person satisfies
              ($person/address/country = "Kenya" and $person/@id = $auction/seller/@person)
      return $auction)
