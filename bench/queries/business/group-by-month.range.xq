(: How many orders there are in each month. :)
declare namespace o = "urn:example:orders";
for $year in 2001 to 2004, $month in 1 to 12
let $members := //o:order[year-from-date(@date) = $year][month-from-date(@date) = $month]
where exists($members)
return <month of="{substring($members[1]/@date, 1, 7)}">{count($members)}</month>
