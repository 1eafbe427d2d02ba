(: A library module: small helpers for texts. Queries import it with
   import module namespace text = 'http://catalogue.example/text' at 'modules/text.xq'; :)
module namespace text = 'http://catalogue.example/text';

(: "Ada Moss" gives "A.M." :)
declare function text:initials($name) {
  string-join(for $word in tokenize(normalize-space($name), ' ')
              return concat(substring($word, 1, 1), '.'), '')
};

(: A text of at most that many characters, cut at the end if need be. :)
declare function text:short($text, $length) {
  if (string-length($text) > $length)
  then concat(substring($text, 1, $length - 3), '...')
  else string($text)
};
