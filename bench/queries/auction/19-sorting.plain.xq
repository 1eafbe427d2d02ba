(: All items in the order of their names, with their locations. :)
for $item in /site/regions//item
let $name := $item/name/text()
order by zero-or-one($name)
return <item name="{$name}">{$item/location/text()}</item>
