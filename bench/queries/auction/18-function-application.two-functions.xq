(: The starting prices in another currency. :)
declare function local:rate() { 2.20371 };
declare function local:converted($amount) { local:rate() * exactly-one($amount/text()) };
for $initial in /site/open_auctions/open_auction/initial return local:converted($initial)
