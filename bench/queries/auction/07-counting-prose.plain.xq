(: How many pieces of prose there are. :)
for $site in /site
return count($site//description) + count($site//annotation) + count($site//emailaddress)
