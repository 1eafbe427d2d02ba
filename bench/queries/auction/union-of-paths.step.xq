(: The names of items and persons. :)
count((//item | //person)/name)
