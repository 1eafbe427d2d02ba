(: How many auctions are sold by people of one country. :)
count(for $auction in /site/open_auctions/open_auction, $person in /site/people/person
      where $auction/seller/@person = $person/@id and $person/address/country = "Kenya"
      return $auction)
