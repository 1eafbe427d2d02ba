(: How many items are described with a piece of a word. :)
count(for $item in //item
      let $prose := string($item/description)
      where contains($prose, "mihil")
      return $item)
