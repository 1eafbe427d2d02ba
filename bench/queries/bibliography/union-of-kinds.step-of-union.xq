(: Articles and books of the first person. :)
count(/bibliography/records/(article | book)[author = /bibliography/people/person[1]/name])
