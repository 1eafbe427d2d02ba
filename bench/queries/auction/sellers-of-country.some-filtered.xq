(: How many auctions are sold by people of one country. :)
count(for $auction in /site/open_auctions/open_auction
      where some $person in //person[address/country = "Kenya"]
            satisfies $auction/seller/@person = $person/@id
      return $auction)
