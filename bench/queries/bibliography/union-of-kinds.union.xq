(: Articles and books of the first person. :)
count((//article | //book)[author = /bibliography/people/person[1]/name])
