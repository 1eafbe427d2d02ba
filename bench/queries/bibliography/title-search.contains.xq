(: How many titles contain a piece of a word and stand beside a keyword. :)
count(/bibliography/records/*[contains(title, "hil")][keyword = "hil"])
