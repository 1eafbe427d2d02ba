(: How many records have more than one author. :)
count(/bibliography/records/*[author/following-sibling::author])
