(: How many persons bought something. :)
count(/site/people/person[@id = /site/closed_auctions/closed_auction/buyer/@person])
