(: How many elements are orders. :)
count(//*[local-name(.) = "order"])
