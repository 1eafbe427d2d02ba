(: How many books nobody cites. :)
let $cited := /bibliography/records/*/cite/@key
return count(/bibliography/records/book[not(@key = $cited)])
