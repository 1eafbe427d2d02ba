(: How many persons there are in each range of income. :)
<result>
  <preferred>{count(for $p in /site/people/person
                    where $p/profile/@income >= 100000 return $p)}</preferred>
  <standard>{count(for $p in /site/people/person
                   where $p/profile/@income < 100000 and $p/profile/@income >= 30000
                   return $p)}</standard>
  <challenge>{count(for $p in /site/people/person
                    where $p/profile/@income < 30000 return $p)}</challenge>
  <unknown>{count(for $p in /site/people/person
                  where count($p/profile/@income) = 0 return $p)}</unknown>
</result>
