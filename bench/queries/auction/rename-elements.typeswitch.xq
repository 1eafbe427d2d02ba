(: The items of one region with emphasis and keywords under other names. :)
declare function local:html($node) {
  typeswitch ($node)
    case element(emph) return <em>{for $child in $node/node() return local:html($child)}</em>
    case element(keyword)
      return <strong>{for $child in $node/node() return local:html($child)}</strong>
    case element() return element {name($node)} {
      $node/@*, for $child in $node/node() return local:html($child)
    }
    default return $node
};
for $item in /site/regions/asia/item return local:html($item)
