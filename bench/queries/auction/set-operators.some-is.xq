(: How many keywords stand in lists, by sets of nodes. :)
let $listed := //listitem//keyword
return count(//keyword[some $other in $listed satisfies $other is .])
