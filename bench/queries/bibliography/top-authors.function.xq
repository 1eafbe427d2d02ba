(: The ten people with most records. :)
declare function local:count($authors, $name) { count($authors[string(.) eq $name]) };
let $authors := /bibliography/records/*/author
return (for $name in distinct-values($authors)
        let $count := local:count($authors, $name)
        order by $count descending
        return <author records="{$count}"/>)[position() <= 10]
