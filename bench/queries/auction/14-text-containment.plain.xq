(: The names of the items whose description emphasizes one word. :)
for $item in /site/regions/*/item
where $item/description//emph = "ho"
return $item/name/text()
