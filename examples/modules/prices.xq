(: A library module: what belongs to prices. Queries import it with
   import module namespace prices = 'http://catalogue.example/prices' at 'modules/prices.xq'; :)
module namespace prices = 'http://catalogue.example/prices';

declare variable $prices:tax := 0.07;

declare function prices:with-tax($net as xs:decimal) as xs:decimal {
  round-half-to-even(xs:decimal($net) * (1 + $prices:tax), 2)
};

(: The price of all copies of an order line, tax included. :)
declare function prices:of-line($book as element(book), $copies as xs:integer) as xs:decimal {
  prices:with-tax($book/price) * xs:integer($copies)
};
