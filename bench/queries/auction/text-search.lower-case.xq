(: How many items are described with a piece of a word. :)
count(//item[contains(lower-case(description), lower-case("mihil"))])
