// libtidy, as the reader of HTML. Nothing else of the library includes its headers.
#pragma once

#include <optional>
#include <string>
#include <string_view>

namespace xquery {

// HTML of any kind as well-formed XHTML in UTF-8: what is missing is added, what cannot be in XML
// is left out. Elements are in the XHTML namespace, svg and math and what is in them in their own.
// The encoding is the one that a signature or the text itself tells, else UTF-8 or, for what is not
// that, Windows-1252. Nothing, and why in `failure`, for a text that nests too deeply (tens of
// thousands of levels), has a tag of more than some thousand attributes or would take time or
// memory out of all proportion, and while several such readings are still to end.
std::optional<std::string> XHTMLFromHTML(std::string_view bytes, std::string& failure);

}  // namespace xquery
