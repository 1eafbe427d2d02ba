(: Articles and books of the first person. :)
let $name := /bibliography/people/person[1]/name
return count(/bibliography/records/*[name() = ("article", "book")][author = $name])
