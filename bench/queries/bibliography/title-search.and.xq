(: How many titles contain a piece of a word and stand beside a keyword. :)
count(/bibliography/records/*[keyword = "hil" and contains(title, "hil")])
