(: The names of the items whose description emphasizes one word. :)
//emph[. = "ho"]/ancestor::description/parent::item/name/text()
