(: Records whose first author comes after the last one in the alphabet. :)
count(//records/*[author[1] > reverse(author)[1]])
