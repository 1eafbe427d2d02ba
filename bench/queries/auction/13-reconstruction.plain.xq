(: The items of one region with their descriptions as they stand. :)
for $item in /site/regions/australia/item
return <item name="{$item/name/text()}">{$item/description}</item>
