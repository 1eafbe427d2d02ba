(: How many pieces of prose there are. :)
count(//*[name() = ("description", "annotation", "emailaddress")])
