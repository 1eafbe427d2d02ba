(: How many orders there are in each month. :)
declare namespace o = "urn:example:orders";
for $month in distinct-values(for $date in //o:order/@date return substring($date, 1, 7))
order by $month
return <month of="{$month}">{count(//o:order[starts-with(@date, $month)])}</month>
