(: How deep the description of an item goes. :)
max(for $node in /site/regions/europe/item/descendant-or-self::*
    return count($node/ancestor-or-self::*)) - 3
