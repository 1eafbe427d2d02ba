(: How many persons bought something. :)
declare function local:buys($sales, $person) {
  some $sale in $sales satisfies $sale/buyer/@person = $person/@id
};
let $sales := /site/closed_auctions/closed_auction
return count(/site/people/person[local:buys($sales, .)])
