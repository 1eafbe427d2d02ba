(: How many titles contain a piece of a word and stand beside a keyword. :)
count(//title[contains(., "hil")][following-sibling::keyword = "hil"])
