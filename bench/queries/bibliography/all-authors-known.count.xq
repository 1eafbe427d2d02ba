(: Records all of whose authors give a home page. :)
let $names := //person[homepage]/name
return count(//records/*[count(author) = count(author[. = $names])])
