(: How many payments there were until the end of each month. :)
declare namespace o = "urn:example:orders";
let $months := for $payment in //o:payment return substring($payment/@date, 1, 7)
for $month in distinct-values($months)
order by $month
return <until month="{$month}">{count($months[. <= $month])}</until>
