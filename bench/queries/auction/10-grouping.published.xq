(: All persons by the category that they are interested in, with what is known of them. :)
let $auction := (/)
return
  for $i in distinct-values($auction/site/people/person/profile/interest/@category)
  let $p :=
    for $t in $auction/site/people/person
    where $t/profile/interest/@category = $i
    return
      <member>
        <facts>
          <sex>{$t/profile/gender/text()}</sex>
          <age>{$t/profile/age/text()}</age>
          <education>{$t/profile/education/text()}</education>
          <income>{fn:data($t/profile/@income)}</income>
        </facts>
        <contact>
          <name>{$t/name/text()}</name>
          <street>{$t/address/street/text()}</street>
          <city>{$t/address/city/text()}</city>
          <country>{$t/address/country/text()}</country>
          <email>{$t/emailaddress/text()}</email>
        </contact>
        <card>{$t/creditcard/text()}</card>
      </member>
  return <category>{<id>{$i}</id>, $p}</category>
