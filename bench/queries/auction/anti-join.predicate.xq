(: How many persons sell nothing. :)
count(/site/people/person[not(@id = /site/open_auctions/open_auction/seller/@person)])
