(: All persons by the category that they are interested in, with what is known of them. :)
declare function local:member($person) {
  <member>
    <facts>
      <sex>{$person/profile/gender/text()}</sex>
      <age>{$person/profile/age/text()}</age>
      <education>{$person/profile/education/text()}</education>
      <income>{string($person/profile/@income)}</income>
    </facts>
    <contact>
      <name>{$person/name/text()}</name>
      <street>{$person/address/street/text()}</street>
      <city>{$person/address/city/text()}</city>
      <country>{$person/address/country/text()}</country>
      <email>{$person/emailaddress/text()}</email>
    </contact>
    <card>{$person/creditcard/text()}</card>
  </member>
};
for $category in distinct-values(/site/people/person/profile/interest/@category)
return <category><id>{$category}</id>{
  for $person in /site/people/person[profile/interest/@category = $category]
  return local:member($person)
}</category>
