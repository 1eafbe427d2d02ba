(: How many records have more than one author. :)
count(/bibliography/records/*[author[last() > 1]])
