(: How many auctions are sold by people of one country. :)
let $ids := /site/people/person[address/country = "Kenya"]/@id
return count(/site/open_auctions/open_auction[seller/@person = $ids])
