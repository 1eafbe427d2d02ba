(: How many persons sell nothing. :)
count(/site/people/person
      except /site/people/person[@id = /site/open_auctions/open_auction/seller/@person])
