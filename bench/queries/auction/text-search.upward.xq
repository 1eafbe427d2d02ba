(: How many items are described with a piece of a word. :)
count(//description[contains(., "mihil")]/parent::item)
