(: Pairs of a book and a thesis by the same person. :)
count(for $book in //book return //thesis[author = $book/author])
