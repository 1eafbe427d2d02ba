(: The name of the last featured item. :)
subsequence(//item[@featured = "yes"], count(//item[@featured = "yes"]), 1)/name/text()
