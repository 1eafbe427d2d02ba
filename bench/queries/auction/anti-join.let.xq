(: How many persons sell nothing. :)
let $sellers := /site/open_auctions/open_auction/seller/@person
return count(/site/people/person[not(@id = $sellers)])
