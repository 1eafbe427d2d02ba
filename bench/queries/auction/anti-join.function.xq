(: How many persons sell nothing. :)
declare function local:sells($auctions, $id) { exists($auctions[seller/@person = $id]) };
let $auctions := /site/open_auctions/open_auction
return count(/site/people/person[not(local:sells($auctions, @id))])
