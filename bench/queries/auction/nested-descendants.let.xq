(: The emphasized words in texts with a keyword within lists. :)
let $lists := //listitem
let $texts := $lists//text[keyword]
return count($texts/emph)
