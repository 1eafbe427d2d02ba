(: Articles and books of the first person. :)
let $name := /bibliography/people/person[1]/name
return count(//author[. = $name]/(parent::article | parent::book))
