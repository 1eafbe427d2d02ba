(: How many persons there are in each range of income. :)
let $auction := (/)
return
<result>
  <preferred>{count($auction/site/people/person/profile[@income >= 100000])}</preferred>
  <standard>{
    count($auction/site/people/person/profile[@income < 100000 and @income >= 30000])
  }</standard>
  <challenge>{count($auction/site/people/person/profile[@income < 30000])}</challenge>
  <unknown>{count(for $p in $auction/site/people/person
                  where empty($p/profile/@income)
                  return $p)}</unknown>
</result>
