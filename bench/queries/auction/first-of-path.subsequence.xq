(: The name of the first featured item. :)
subsequence(//item[@featured = "yes"], 1, 1)/name/text()
