(: How many records have more than one author. :)
count(//records/*[author != author])
