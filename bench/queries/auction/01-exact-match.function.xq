(: The name of one person, found by its identifier. :)
declare function local:named($people, $id) { $people[@id = $id]/name/text() };
local:named(/site/people/person, "person0")
