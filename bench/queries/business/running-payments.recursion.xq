(: How many payments there were until the end of each month. :)
declare namespace o = "urn:example:orders";
declare function local:until($sum, $months, $keys) {
  if (empty($months)) then ()
  else let $next := $sum + count($keys[. = $months[1]])
       return (<until month="{$months[1]}">{$next}</until>,
               local:until($next, subsequence($months, 2), $keys))
};
let $keys := for $payment in //o:payment return substring($payment/@date, 1, 7)
let $months := for $month in distinct-values($keys) order by $month return $month
return local:until(0, $months, $keys)
