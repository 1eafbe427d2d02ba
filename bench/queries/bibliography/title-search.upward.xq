(: How many titles contain a piece of a word and stand beside a keyword. :)
count(//keyword[. = "hil"]/../title[contains(., "hil")])
