(: The persons who give no home page. :)
for $person in /site/people/person
where every $page in $person/homepage satisfies empty($page/text())
return <person name="{$person/name/text()}"/>
