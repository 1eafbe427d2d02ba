(: The items of one region with emphasis and keywords under other names. :)
declare function local:html($node) {
  if (name($node) = "emph")
  then <em>{for $child in $node/node() return local:html($child)}</em>
  else if (name($node) = "keyword")
  then <strong>{for $child in $node/node() return local:html($child)}</strong>
  else if ($node instance of element())
  then element {name($node)} {$node/@*, for $child in $node/node() return local:html($child)}
  else $node
};
for $item in /site/regions/asia/item return local:html($item)
