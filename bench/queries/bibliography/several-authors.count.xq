(: How many records have more than one author. :)
count(/bibliography/records/*[count(author) > 1])
