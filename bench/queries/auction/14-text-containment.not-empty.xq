(: The names of the items whose description emphasizes one word. :)
for $item in //regions/*/item
where not(empty($item/description//emph[. eq "ho"]))
return $item/name/text()
