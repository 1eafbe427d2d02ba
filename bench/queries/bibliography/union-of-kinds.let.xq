(: Articles and books of the first person. :)
let $name := string(/bibliography/people/person[1]/name)
return count((//article | //book)[author = $name])
