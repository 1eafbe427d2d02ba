(: The date of the dearest sale. :)
/site/closed_auctions/closed_auction
  [number(price) = max(/site/closed_auctions/closed_auction/price)]/date/text()
