// Nodes as text for people to read. (XML that reads back as the same nodes is what the functions of
// NSXMLNode write.)
#pragma once

#include "xquery/Export.h"

#include <functional>
#include <string_view>

namespace xquery {

class NSXMLNode;

// XML with each element on a line of its own, indented by two blanks for each level. White space is
// put in and taken away only between the children of elements that hold no other text; never within
// an element that holds text, nor within one that says xml:space="preserve". Written in UTF-8, in
// pieces of bounded size; stops when `write` answers false.
//
//   XQueryWriteIndentedXML(*document, [](std::string_view xml) { return put(xml); });
XQUERY_EXPORT void XQueryWriteIndentedXML(const NSXMLNode& node,
                                          const std::function<bool(std::string_view)>& write);

}  // namespace xquery
