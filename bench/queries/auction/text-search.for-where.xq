(: How many items are described with a piece of a word. :)
count(for $item in /site/regions/*/item where contains($item/description, "mihil") return $item)
