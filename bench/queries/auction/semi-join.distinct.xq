(: How many persons bought something. :)
count(for $id in distinct-values(//buyer/@person) return /site/people/person[@id = $id])
