(: The names of the items whose description emphasizes one word. :)
for $item in /site/regions//item
where count(for $emph in $item/description//emph where $emph = "ho" return $emph) > 0
return $item/name/text()
