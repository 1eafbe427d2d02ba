(: How many persons there are in each range of income. :)
<result>
  <preferred>{count(/site/people/person/profile[@income >= 100000])}</preferred>
  <standard>{count(/site/people/person/profile[@income < 100000 and @income >= 30000])}</standard>
  <challenge>{count(/site/people/person/profile[@income < 30000])}</challenge>
  <unknown>{count(for $person in /site/people/person
                  where empty($person/profile/@income)
                  return $person)}</unknown>
</result>
