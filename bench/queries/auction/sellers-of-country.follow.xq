(: How many auctions are sold by people of one country. :)
count(for $auction in /site/open_auctions/open_auction
      where /site/people/person[@id = $auction/seller/@person]/address/country = "Kenya"
      return $auction)
