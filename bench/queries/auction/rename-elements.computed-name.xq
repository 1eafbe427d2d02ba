(: The items of one region with emphasis and keywords under other names. :)
declare function local:renamed($name) {
  if ($name = "emph") then "em" else if ($name = "keyword") then "strong" else $name
};
declare function local:html($nodes) {
  for $node in $nodes
  return typeswitch ($node)
    case $element as element() return
      element {local:renamed(local-name($element))} {$element/@*, local:html($element/node())}
    case $text as text() return $text
    default return ()
};
local:html(/site/regions/asia/item)
