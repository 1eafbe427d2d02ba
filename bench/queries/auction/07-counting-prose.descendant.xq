(: How many pieces of prose there are. :)
count(//description) + count(//annotation) + count(//emailaddress)
