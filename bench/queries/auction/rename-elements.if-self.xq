(: The items of one region with emphasis and keywords under other names. :)
declare function local:html($node) {
  if ($node/self::emph)
  then <em>{for $child in $node/node() return local:html($child)}</em>
  else if ($node/self::keyword)
  then <strong>{for $child in $node/node() return local:html($child)}</strong>
  else if ($node/self::*)
  then element {name($node)} {$node/@*, for $child in $node/node() return local:html($child)}
  else $node
};
for $item in /site/regions/asia/item return local:html($item)
