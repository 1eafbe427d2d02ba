(: The starting prices in another currency. :)
for $initial in /site/open_auctions/open_auction/initial return 2.20371 * $initial
