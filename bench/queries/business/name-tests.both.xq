(: How many elements are orders. :)
count(//*[local-name() = "order" and string(namespace-uri(.)) = "urn:example:orders"])
