// Nodes as text in other forms than the functions of NSXMLNode write, which is XML that reads back
// as the same nodes wherever it stands: for people to read, and part by part.
#pragma once

#include "xquery/Export.h"

#include <functional>
#include <string_view>

namespace xquery {

class NSXMLElement;
class NSXMLNode;

// XML with each element on a line of its own, indented by two blanks for each level. White space is
// put in and taken away only between the children of elements that hold no other text; never within
// an element that holds text, nor within one that says xml:space="preserve". Written in UTF-8, in
// pieces of bounded size; stops when `write` answers false.
//
//   XQueryWriteIndentedXML(*document, [](std::string_view xml) { return put(xml); });
XQUERY_EXPORT void XQueryWriteIndentedXML(const NSXMLNode& node,
                                          const std::function<bool(std::string_view)>& write);

// The start tag of an element, and a node with all that is in it, as they are written where they
// stand: without the declarations of namespaces that the start tags of the elements around them
// make. So a document of more text than there is memory is written as it is made, or with parts
// left out: start tags, what is between them, and end tags, which have the names of the elements as
// they are written (`nameView`), provided that these were read. In UTF-8 and pieces of bounded
// size, until `write` answers false.
//
//   XQueryWriteStartTag(*element, put);
//   for (const NSXMLNode* child = element->firstChild(); child; child = child->nextSibling()) {
//     if (isWanted(*child)) XQueryWriteXMLInPlace(*child, put);
//   }
//   put("</" + element->nameView().utf8() + ">");
XQUERY_EXPORT void XQueryWriteStartTag(const NSXMLElement& element,
                                       const std::function<bool(std::string_view)>& write);
XQUERY_EXPORT void XQueryWriteXMLInPlace(const NSXMLNode& node,
                                         const std::function<bool(std::string_view)>& write);

}  // namespace xquery
