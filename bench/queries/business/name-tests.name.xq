(: How many elements are orders. :)
count(//*[name() = "o:order"])
