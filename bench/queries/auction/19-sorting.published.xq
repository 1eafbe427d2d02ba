(: All items in the order of their names, with their locations. :)
let $auction := (/)
return
  for $b in $auction/site/regions//item
  let $k := $b/name/text()
  order by zero-or-one($b/name) ascending empty greatest
  return <item name="{$k}">{$b/location/text()}</item>
