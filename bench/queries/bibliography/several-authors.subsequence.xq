(: How many records have more than one author. :)
count(/bibliography/records/*[not(empty(subsequence(author, 2)))])
