(: How many elements are orders. :)
count(//*:order)
