(: The names of the items whose description emphasizes one word. :)
for $item in /site/regions/*/item
where exists($item/description//emph[string(.) = "ho"])
return $item/name/text()
