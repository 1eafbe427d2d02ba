(: How many auctions are sold by people of one country. :)
sum(for $person in //person[address/country = "Kenya"]
    return count(//open_auction[seller/@person = $person/@id]))
