(: How many persons bought something. :)
sum(for $person in /site/people/person
    return if (/site/closed_auctions/closed_auction/buyer/@person = $person/@id) then 1 else 0)
