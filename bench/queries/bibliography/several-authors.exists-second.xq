(: How many records have more than one author. :)
count(/bibliography/records/*[exists(author[position() = 2])])
