(: The names of items and persons. :)
count(//*[local-name() = ("item", "person")]/name)
