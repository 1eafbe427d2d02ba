(: How many persons there are in each range of income. :)
let $incomes := /site/people/person/profile/@income
return
<result>
  <preferred>{count($incomes[. >= 100000])}</preferred>
  <standard>{count($incomes[. >= 30000][. < 100000])}</standard>
  <challenge>{count($incomes[. < 30000])}</challenge>
  <unknown>{count(/site/people/person[not(profile/@income)])}</unknown>
</result>
