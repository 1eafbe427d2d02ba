(: How many records have more than one author. :)
count(//author[2]/..)
