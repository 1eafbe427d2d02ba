(: How many payments there were until the end of each month. :)
declare namespace o = "urn:example:orders";
let $keys := for $payment in //o:payment return substring($payment/@date, 1, 7)
let $months := for $month in distinct-values($keys)
               order by $month
               return <m of="{$month}">{count($keys[. = $month])}</m>
for $month at $i in $months
return <until month="{$month/@of}">{sum($months[position() <= $i])}</until>
