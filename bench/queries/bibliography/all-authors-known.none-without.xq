(: Records all of whose authors give a home page. :)
let $names := //person[not(homepage)]/name
return count(//records/*[not(author = $names)])
