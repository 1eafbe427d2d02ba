(: The names of the items whose description emphasizes one word. :)
/site/regions/*/item[description//emph = "ho"]/name/text()
