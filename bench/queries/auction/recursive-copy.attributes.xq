(: The items of one region, copied node by node. :)
declare function local:copy($node) {
  if ($node instance of element())
  then element {name($node)} {
    for $attribute in $node/@* return attribute {name($attribute)} {string($attribute)},
    for $child in $node/node() return local:copy($child)
  }
  else text {string($node)}
};
<region>{for $item in /site/regions/africa/item return local:copy($item)}</region>
