(: The names of the items whose description emphasizes one word. :)
for $item in /site/regions/*/item
where some $emph in $item/description//emph satisfies $emph = "ho"
return $item/name/text()
