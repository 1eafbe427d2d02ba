(: How many auctions are sold by people of one country. :)
count(/site/open_auctions/open_auction
      [seller/@person = /site/people/person[address/country = "Kenya"]/@id])
