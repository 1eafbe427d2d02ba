(: Pairs of a book and a thesis by the same person. :)
sum(for $thesis in //thesis return count(//book[author = $thesis/author]))
