(: The starting prices in another currency. :)
declare function local:converted($amount) { $amount * 2.20371 };
for $initial in /site/open_auctions/open_auction/initial return local:converted(number($initial))
