(: How many persons bought something. :)
let $buyers := /site/closed_auctions/closed_auction/buyer/@person
return count(/site/people/person[@id = $buyers])
