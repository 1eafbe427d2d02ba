(: All items in the order of their names, with their locations. :)
for $item in (for $item in //item order by data($item/name) return $item)
return <item name="{$item/name/text()}">{$item/location/text()}</item>
