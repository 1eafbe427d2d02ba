(: All items in the order of their names, with their locations. :)
for $item in //item
let $name := exactly-one($item/name/text())
order by $name
return <item name="{$name}">{$item/location/text()}</item>
