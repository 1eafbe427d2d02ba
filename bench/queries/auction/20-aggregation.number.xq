(: How many persons there are in each range of income. :)
let $numbers := for $income in //profile/@income return number($income)
return
<result>
  <preferred>{count($numbers[. ge 100000])}</preferred>
  <standard>{count(for $n in $numbers where $n < 100000 and $n ge 30000 return $n)}</standard>
  <challenge>{count($numbers[. lt 30000])}</challenge>
  <unknown>{count(//person) - count($numbers)}</unknown>
</result>
