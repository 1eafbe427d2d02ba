(: How many keywords stand in lists within lists. :)
count(for $keyword in //keyword
      let $lists := $keyword/ancestor::listitem
      where count($lists) >= 2
      return $keyword)
