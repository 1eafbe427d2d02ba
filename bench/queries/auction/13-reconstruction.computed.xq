(: The items of one region with their descriptions as they stand. :)
for $item in //australia/item
return element item {attribute name {$item/name/text()}, $item/description}
