(: The items of one region, copied node by node. :)
declare function local:copies($nodes) {
  for $node in $nodes
  return if ($node/self::element())
         then element {name($node)} {$node/@*, local:copies($node/node())}
         else $node
};
<region>{local:copies(/site/regions/africa/item)}</region>
