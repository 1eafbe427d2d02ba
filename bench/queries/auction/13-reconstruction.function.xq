(: The items of one region with their descriptions as they stand. :)
declare function local:item($item) { <item name="{$item/name}">{$item/description}</item> };
for $item in /site/regions/australia/item return local:item($item)
