(: All items in the order of their names, with their locations. :)
for $item in /site/regions/*/item
order by string($item/name)
return <item name="{$item/name}">{$item/location/text()}</item>
