(: The items of one region, copied node by node. :)
declare function local:copy($node) {
  typeswitch ($node)
    case element() return element {node-name($node)} {
      $node/@*, for $child in $node/node() return local:copy($child)
    }
    default return $node
};
<region>{for $item in /site/regions/africa/item return local:copy($item)}</region>
