(: How many payments there were until the end of each month. :)
declare namespace o = "urn:example:orders";
for $month in distinct-values(for $payment in //o:payment return substring($payment/@date, 1, 7))
order by $month
return <until month="{$month}">{
  count(for $payment in //o:payment
        where substring($payment/@date, 1, 7) <= $month
        return $payment)
}</until>
