(: How many titles contain a piece of a word and stand beside a keyword. :)
count(//records/*[title/text()[contains(., "hil")]][exists(keyword[text() = "hil"])])
