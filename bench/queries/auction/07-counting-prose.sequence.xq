(: How many pieces of prose there are. :)
count((//description, //annotation, //emailaddress))
