(: The starting prices in another currency. :)
declare namespace shop = "urn:shop";
declare function shop:converted($amount) { 2.20371 * $amount };

for $initial in /site/open_auctions/open_auction/initial
return shop:converted(zero-or-one($initial))
