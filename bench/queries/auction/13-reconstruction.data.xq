(: The items of one region with their descriptions as they stand. :)
for $item in /site/regions/australia/item
let $name := data($item/name), $description := $item/description
return <item name="{$name}">{$description}</item>
