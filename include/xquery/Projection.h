// Documents of which only that is made what a query needs of them.
//
// A compiled query knows which parts of its context document it can look at. For a query that needs
// little, as count(//item), a document that is read for it takes a fraction of the memory and half
// of the time. All of the text is read and must be well formed all the same: a document is refused
// as NSXMLDocument would refuse it, with the same error.
//
//   auto query = XQuery::xqueryWithSource("sum(//sale/price)");
//   NSXMLParseError failure;
//   auto document = XQueryProjectedDocumentWithFile(*query, "sales.xml",
//                                                   NSXMLNodePreserveWhitespace, &failure);
//   if (document) use(context->evaluateXQuery(*query, {}, document, &error));
//
// Such a document is for its query alone, as the context item, and for nothing else: the query
// answers what it would answer for the whole document, and any other would meet what happens to be
// there. Nodes of the result have all that is below them, in the namespaces that they are in; the
// elements above them are there and the nodes beside them may not be. A host that asks for those,
// or for the place of a node (NSXMLNode::XPath), reads the whole document.
#pragma once

#include "xquery/XMLNode.h"

#include <cstdint>
#include <string>
#include <string_view>

namespace xquery {

class XQuery;

// What a query needs of its document. Nothing is left out for a query that was compiled to be
// evaluated as it is written, as XQUERY_PLAN=0 does, or that has errors.
struct XQueryProjection {
  bool isWhole = true;       // all of the document is needed
  bool answersNodes = true;  // nodes of the document may be items of the result
  // For people, in UTF-8: what is needed, as "/site/person/@id, the text of //price", or where and
  // why all is. The words may change.
  std::string description;
};
[[nodiscard]] XQUERY_EXPORT XQueryProjection XQueryProjectionOf(const XQuery& query);

// As NSXMLDocument::documentWithFile and documentWithData, of what the query needs; the whole
// document where all is needed, and of HTML.
[[nodiscard]] XQUERY_EXPORT Ref<NSXMLDocument> XQueryProjectedDocumentWithFile(
    const XQuery& query, const std::string& path, uint32_t options,
    NSXMLParseError* error = nullptr, const NSXMLReadingProgress& progress = {});
[[nodiscard]] XQUERY_EXPORT Ref<NSXMLDocument> XQueryProjectedDocumentWithData(
    const XQuery& query, std::string_view bytes, uint32_t options,
    NSXMLParseError* error = nullptr);

}  // namespace xquery
