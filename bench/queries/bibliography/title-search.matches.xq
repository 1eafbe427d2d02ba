(: How many titles contain a piece of a word and stand beside a keyword. :)
count(//records/*[matches(title, "hil")][some $word in keyword satisfies $word = "hil"])
