(: Records whose first author comes after the last one in the alphabet. :)
count(/bibliography/records/*[author[position() = 1] > author[position() = last()]])
