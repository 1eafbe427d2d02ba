(: Pairs of a book and a thesis by the same person. :)
declare function local:share($a, $b) { $a/author = $b/author };
count(for $book in //book, $thesis in //thesis
      where local:share($book, $thesis)
      return $thesis)
