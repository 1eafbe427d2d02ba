(: Records whose first author comes after the last one in the alphabet. :)
count(/bibliography/records/*[author[1] > author[last()]])
