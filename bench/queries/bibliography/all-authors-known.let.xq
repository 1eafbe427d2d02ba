(: Records all of whose authors give a home page. :)
let $names := /bibliography/people/person[homepage]/name
return count(/bibliography/records/*[every $author in author satisfies $author = $names])
