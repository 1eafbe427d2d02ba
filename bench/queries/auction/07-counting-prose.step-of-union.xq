(: How many pieces of prose there are. :)
count(/site//(description | annotation | emailaddress))
