(: Records whose first author comes after the last one in the alphabet. :)
count(/bibliography/records/*
      [subsequence(author, 1, 1) gt subsequence(author, count(author), 1)])
