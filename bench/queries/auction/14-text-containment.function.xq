(: The names of the items whose description emphasizes one word. :)
declare function local:stresses($item, $word) { $item/description//emph = $word };
for $item in /site/regions/*/item
where local:stresses($item, "ho")
return $item/name/text()
