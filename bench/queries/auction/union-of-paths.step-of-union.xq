(: The names of items and persons. :)
count(/site//(item | person)/name)
