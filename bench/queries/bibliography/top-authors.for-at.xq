(: The ten people with most records. :)
for $author at $i in (for $name in distinct-values(/bibliography/records/*/author)
                      let $count := count(//author[. = $name])
                      order by $count descending
                      return <author records="{$count}"/>)
where $i <= 10
return $author
